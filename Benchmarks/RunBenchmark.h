// SPDX-License-Identifier: MIT
// Runs of an empty macro through the module.
#pragma once

class Section;

// All on one thread with an apartment, for which the Ruby engine is activated. False, with the
// reason on standard error, when something does not run; an exception when a file is missing.

// Runs in JScript against the same steps without the module, and later ones in Ruby.
bool CompareRuns(Section& section);
// The first Ruby run in a process, against a process `ruby.exe -e ""`.
bool CompareFirstRuns(Section& section);
// The other process's part of that, which it takes when started with this argument: its exit code is
// the microseconds of its first run, or 0 when that has failed.
inline constexpr char kFirstRunOption[] = "--first-run";
unsigned FirstRunMicroseconds();
