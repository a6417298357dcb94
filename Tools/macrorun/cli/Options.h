// SPDX-License-Identifier: MIT
// The command line.
//
// Errors: ParseOptions prints the error and returns an exit code.
// Units: seconds. Threading: the main thread.
#pragma once

#include <filesystem>
#include <optional>
#include <string>
#include <vector>

#include "host/Language.h"
#include "host/RunOptions.h"

struct Options {
  RunOptions run;
  LanguageOptions language;
  std::vector<std::filesystem::path> inputs;  // none: an empty text; "-": standard input
  bool each = false;                          // given by --each

  std::filesystem::path output;  // empty: standard output
  bool inPlace = false;

  std::filesystem::path module;

  bool jsonErrors = false;
  std::filesystem::path log;  // empty: none

  std::filesystem::path test;  // a folder of macros, or one macro; empty: not given
  bool promote = false;

  std::vector<std::filesystem::path> check;  // the macros to check instead of running
  std::filesystem::path record;              // the recording to convert instead of running
  std::string functions;                     // "text" or "markdown"; empty: not given
  bool stubs = false;
  bool version = false;
};

// Parses the process's command line. Returns an exit code after --help and for a wrong command
// line.
std::optional<int> ParseOptions(Options& options);
