// SPDX-License-Identifier: MIT
// The command line.
//
// Errors: ParseOptions tells the user what was wrong and answers an exit code.
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
  bool each = false;                          // the inputs come from --each

  std::filesystem::path output;  // empty: standard output
  bool inPlace = false;

  std::filesystem::path module;

  bool jsonErrors = false;
  std::filesystem::path log;  // empty: none

  std::filesystem::path test;  // the folder whose macros to test; empty: not given
  bool promote = false;

  std::vector<std::filesystem::path> check;  // the macros to check; nothing is run
  std::filesystem::path record;              // the steps to make a macro of; likewise
  std::string functions;  // the form in which to list them, "text" or "markdown"; empty: not at all
  bool stubs = false;
  bool version = false;
};

// Reads the process's command line. An exit code when there is nothing to run: help was asked for,
// or the command line is wrong (and the user has been told).
std::optional<int> ParseOptions(Options& options);
