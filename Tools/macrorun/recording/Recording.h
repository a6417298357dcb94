// SPDX-License-Identifier: MIT
// What a user typed and did while a macro was recorded, from a file of JSON: see "Recording" in
// Docs/macrorun.md.
//
// Texts are bytes without a zero byte, which could not pass to a macro function.
// Ownership: steps point to functions of the table, which stay. Errors: UsageError, which names the
// file, the step (from 1) and the key. Threading: any thread.
#pragma once

#include <cstdint>
#include <filesystem>
#include <span>
#include <string>
#include <variant>
#include <vector>

#include "functions/MacroFunctions.h"

// A whole number of 32 bits is an integer, however it is written: not every language tells 2 from 2.0.
using StepArgument = std::variant<std::int32_t, double, std::string>;

struct RecordedStep {
  enum class Kind { kText, kEnter, kCall };

  std::string place;  // "FILE: step 3", for messages
  Kind kind;
  std::string text;                         // typed
  const MacroFunction* function = nullptr;  // called
  std::vector<StepArgument> arguments = {};
};

// Refuses what would be wrong in any document; the rest shows when the macro runs.
std::vector<RecordedStep> ReadRecording(const std::filesystem::path& file);

// A step's arguments as the function gets them; the list points into the object.
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
