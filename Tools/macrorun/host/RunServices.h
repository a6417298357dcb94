// SPDX-License-Identifier: MIT
// What macro functions get from this program: the user, the command line, and other macros.
//
// Ownership: everything it is made with is the caller's. Threading: the run's thread.
#pragma once

#include <filesystem>
#include <set>
#include <string>
#include <vector>

#include "functions/EditorServices.h"
#include "host/RunOptions.h"
#include "report/Reporter.h"

class RunControl;

// Runs a macro inside the present call; whether it has succeeded.
class NestedRunner {
 public:
  virtual ~NestedRunner() = default;
  virtual bool RunNested(const std::filesystem::path& macro) = 0;
};

class RunServices final : public EditorServices {
 public:
  // The names of arguments that macros ask for are added to the set.
  RunServices(const RunOptions& runOptions, Reporter& runReporter, NestedRunner& runner,
              std::set<std::string>& namesRead)
      : options(runOptions), reporter(runReporter), nested(runner), argumentsRead(namesRead) {}

  // Whose time stands still while the user is asked; before the first prompt.
  void SetControl(RunControl* runControl) { control = runControl; }
  // Around each run.
  void EnterMacro(const std::filesystem::path& macro) { macros.push_back(macro); }
  void LeaveMacro() { macros.pop_back(); }

  // Also what a script engine itself says by it.
  void Message(const std::string& text) override;
  // The answers of the command line come first, then those of a user at a terminal, whose empty line
  // is the proposal, and elsewhere the proposal.
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
