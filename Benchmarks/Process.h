// SPDX-License-Identifier: MIT
// Other programs, timed as a whole.
#pragma once

#include <windows.h>

#include <filesystem>
#include <string>

struct ProcessTime {
  double seconds;  // from its creation to its end
  DWORD exitCode;  // STILL_ACTIVE (259) when it could not be started
};

// `output` receives its standard output; an empty path: it goes where this program's goes.
ProcessTime TimeProcess(std::wstring commandLine, const std::filesystem::path& output = {});

// The program's path in quotes, and arguments that are quoted already.
std::wstring CommandLine(const std::filesystem::path& program, const std::wstring& arguments);
