// SPDX-License-Identifier: MIT
// What macro functions need besides the documents: the user, the command line and other macros.
// RunServices implements it.
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
  // Asks the user. Returns the proposal, if there is one, when no user can be asked, and nothing
  // when there is no answer.
  virtual std::optional<std::string> Prompt(const std::string& question,
                                            const std::optional<std::string>& proposal) = 0;
  // The value of --arg for a name; nothing without one.
  virtual std::optional<std::string> MacroArgument(const std::string& name) = 0;
  // Runs another macro on the same documents, inside the current call; whether it succeeded. The
  // path is relative to the folder of the calling macro.
  virtual bool RunMacro(const std::filesystem::path& macro) = 0;
};
