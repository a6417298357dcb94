// SPDX-License-Identifier: MIT
// The command line.
#pragma once

#include <filesystem>
#include <optional>

struct Options {
  std::filesystem::path macro;
  std::filesystem::path input;  // empty: none; "-": standard input
  std::filesystem::path module;
  std::filesystem::path description;  // empty: not given
  bool trace = false;
  bool version = false;
};

// The folder of this program.
std::filesystem::path ProgramFolder();

// Reads the process's command line. An exit code when there is nothing to run: help was asked for,
// or the command line is wrong (and the user has been told).
std::optional<int> ParseOptions(Options& options);
