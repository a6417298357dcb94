// SPDX-License-Identifier: MIT
// What the macro functions need beyond the documents: the user, the command line and the runner.
// Implemented by the run (MacroRun), used by the functions (MacroFunctions).
//
// Texts are bytes, UTF-8 by convention. Threading: the macro run's thread.
#pragma once

#include <filesystem>
#include <optional>
#include <string>

class EditorServices {
 public:
  virtual ~EditorServices() = default;

  // Shows a line to the user.
  virtual void Message(const std::string& text) = 0;
  // Asks the user; the proposal, if there is one, when there is nobody to ask. Nothing when there is no
  // answer.
  virtual std::optional<std::string> Prompt(const std::string& question,
                                            const std::optional<std::string>& proposal) = 0;
  // The value that the command line gives to a name; nothing without one.
  virtual std::optional<std::string> MacroArgument(const std::string& name) = 0;
  // Runs another macro over the same documents, inside the present one; whether it succeeded. The
  // path counts from the folder of the running macro.
  virtual bool RunMacro(const std::filesystem::path& macro) = 0;
};
