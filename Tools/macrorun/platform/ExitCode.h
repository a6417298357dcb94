// SPDX-License-Identifier: MIT
// Exit codes of the program.
#pragma once

#include <stdexcept>

enum ExitCode {
  kSuccess = 0,
  kMacroFailed = 1,  // it did not parse, ended with an error, or called a macro function wrongly
  kWrongUsage = 2,   // UsageError
  kStopped = 3,      // by Ctrl+C or a timeout
  kFault = 4,        // in this program, the module or the script engine
};

// An error that the user must correct before a macro can run. The text names the file or option.
struct UsageError : std::runtime_error {
  using std::runtime_error::runtime_error;
};
