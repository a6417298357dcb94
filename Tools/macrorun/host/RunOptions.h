// SPDX-License-Identifier: MIT
// What the user asks of the runs of one macro.
#pragma once

#include <filesystem>
#include <map>
#include <string>
#include <vector>

struct RunOptions {
  std::filesystem::path macro;
  std::map<std::string, std::string> arguments;
  std::vector<std::string> answers;
  unsigned repeat = 1;
  double timeout = 0;  // seconds; 0: none
  bool keepGoing = false;
  bool trace = false;
  bool profile = false;
};
