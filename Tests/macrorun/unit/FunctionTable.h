// SPDX-License-Identifier: MIT
// Calls macro functions as a macro does.
//
// A document is written as one text: `|` is the cursor, `[` before it the start of the selection.
#pragma once

#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "functions/MacroFunctions.h"

struct FakeServices : EditorServices {
  void Message(const std::string& text) override { messages += text + "\n"; }
  std::optional<std::string> Prompt(const std::string& question,
                                    const std::optional<std::string>& proposal) override {
    if (question == "no answer?") return proposal;
    return question + "=" + proposal.value_or("");
  }
  std::optional<std::string> MacroArgument(const std::string& name) override {
    const auto argument = arguments.find(name);
    if (argument == arguments.end()) return {};
    return argument->second;
  }
  bool RunMacro(const std::filesystem::path& macro) override;

  Editor* editor = nullptr;
  std::string messages;
  std::map<std::string, std::string> arguments;
};

struct Call {
  std::string function;
  std::vector<std::string> arguments = {};
};

Document FromPicture(std::string_view picture);
std::string Picture(const Document& document);

// The result as text. Throws WrongCall.
std::string Do(Editor& editor, EditorServices& services, const Call& call);
