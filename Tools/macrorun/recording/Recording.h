// SPDX-License-Identifier: MIT
// The steps of a recording, read from a JSON file: see "Recording" in Docs/macrorun.md.
//
// Texts are bytes without a zero byte, which would end an argument of a macro function.
// Ownership: steps point to the static table of functions. Errors: UsageError, which names the
// file, the step (from 1) and the key. Threading: any thread.
#pragma once

#include <cstdint>
#include <filesystem>
#include <span>
#include <string>
#include <variant>
#include <vector>

#include "functions/MacroFunctions.h"

// A whole number of 32 bits is an integer, also when written 2.0: some languages do not distinguish
// them.
using StepArgument = std::variant<std::int32_t, double, std::string>;

struct RecordedStep {
  enum class Kind { kText, kEnter, kCall };

  std::string place;  // "FILE: step 3", for messages
  Kind kind;
  std::string text;                         // typed
  const MacroFunction* function = nullptr;  // called
  std::vector<StepArgument> arguments = {};
};

// Refuses what every document would refuse. The macro function checks the rest.
std::vector<RecordedStep> ReadRecording(const std::filesystem::path& file);

// A step's arguments in the form for a function. The list points into the object.
class PassedArguments {
 public:
  explicit PassedArguments(const std::vector<StepArgument>& arguments);
  PassedArguments(const PassedArguments&) = delete;
  PassedArguments& operator=(const PassedArguments&) = delete;

  std::span<const HostArgument> List() const { return list; }

 private:
  std::vector<std::string> texts;
  std::vector<HostArgument> list;
};
