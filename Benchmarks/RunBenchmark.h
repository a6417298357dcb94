// SPDX-License-Identifier: MIT
// Runs of an empty macro through the module that ships, in a folder of its own.
#pragma once

#include <filesystem>

// Where this program lies, beside what it measures.
std::filesystem::path ProgramFolder();

// All on one thread with an apartment, for which the engine is activated. False, with the reason on
// standard error, when something does not run; an exception when a file is missing.

// The second and later runs, against runs of the module with an engine that does nothing.
bool CompareLaterRuns();
// The first run in a process, against a process `ruby.exe -e ""`.
bool CompareFirstRuns();
// The other process's part of that, which it takes when started with this argument: its exit code is
// the microseconds of its first run, or 0 when that has failed.
inline constexpr char kFirstRunOption[] = "--first-run";
unsigned FirstRunMicroseconds();
