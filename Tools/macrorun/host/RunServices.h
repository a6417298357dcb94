// SPDX-License-Identifier: MIT
// Implements EditorServices with the user's terminal, the command line and nested runs.
//
// Ownership: the constructor's arguments belong to the caller. Threading: the run's thread.
#pragma once

#include <filesystem>
#include <set>
#include <string>
#include <vector>

#include "functions/EditorServices.h"
#include "host/RunOptions.h"
#include "report/Reporter.h"

class RunControl;

// Runs a macro inside the current call; whether it succeeded.
class NestedRunner {
 public:
  virtual ~NestedRunner() = default;
  virtual bool RunNested(const std::filesystem::path& macro) = 0;
};

class RunServices final : public EditorServices {
 public:
  // Adds the names of the arguments that macros read to the set.
  RunServices(const RunOptions& runOptions, Reporter& runReporter, NestedRunner& runner,
              std::set<std::string>& namesRead)
      : options(runOptions), reporter(runReporter), nested(runner), argumentsRead(namesRead) {}

  // Its timeout is paused during prompts. Call it before the first prompt.
  void SetControl(RunControl* runControl) { control = runControl; }
  // Enclose each run.
  void EnterMacro(const std::filesystem::path& macro) { macros.push_back(macro); }
  void LeaveMacro() { macros.pop_back(); }

  // Shows a message of the macro or of its engine.
  void Message(const std::string& text) override;
  // Returns the answers of the command line first. Then it asks the user at a terminal, where an
  // empty line means the proposal. Without a terminal it returns the proposal.
  std::optional<std::string> Prompt(const std::string& question,
                                    const std::optional<std::string>& proposal) override;
  std::optional<std::string> MacroArgument(const std::string& name) override;
  bool RunMacro(const std::filesystem::path& macro) override;

 private:
  std::optional<std::string> AskUser(const std::string& question, const std::string& proposal);

  const RunOptions& options;
  Reporter& reporter;
  NestedRunner& nested;
  std::set<std::string>& argumentsRead;
  RunControl* control = nullptr;
  std::vector<std::filesystem::path> macros;  // outermost first
  std::size_t answersTaken = 0;
};
