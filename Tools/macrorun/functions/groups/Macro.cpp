// SPDX-License-Identifier: MIT
// The user, the command line and other macros.
#include "functions/MacroCall.h"
#include "functions/groups/FunctionGroups.h"
#include "platform/Encoding.h"

namespace {

using Kind = ParameterKind;

MacroResult Prompt(MacroCall& call) {
  std::optional<std::string> proposal;
  if (call.Has(1)) proposal = call.Text(1);
  const std::optional<std::string> answer = call.services.Prompt(call.Text(0), proposal);
  if (!answer) call.Fail("an answer, got none (use --answer)");
  return *answer;
}

MacroResult Argument(MacroCall& call) {
  const std::optional<std::string> value = call.services.MacroArgument(call.Text(0));
  if (value) return *value;
  if (!call.Has(1)) call.Fail(0, "the name of an argument of the macro (use --arg NAME=VALUE)");
  return call.Text(1);
}

constexpr ResultKind kText = ResultKind::kText;

const std::vector<MacroFunction> kFunctions = {
    {"message",
     {{"text", Kind::kTexts}},
     ResultKind::kNone,
     "shows texts to the user, with spaces between them",
     [](MacroCall& call) -> MacroResult {
       call.services.Message(call.Text(0));
       return 0;
     }},
    {"prompt",
     {{"question", Kind::kText},
      {"default", Kind::kText, "an empty text; without a terminal the call fails"}},
     kText,
     "asks the user and returns the answer; an empty line, or no terminal, means the default",
     Prompt},
    {"argument",
     {{"name", Kind::kName}, {"default", Kind::kText, "the call fails without a value"}},
     kText,
     "returns the value of a macro argument, or the default",
     Argument},
    {"run_macro",
     {{"path", Kind::kName}},
     ResultKind::kNumber,
     "runs another macro on the same documents, its path relative to this macro's folder; returns "
     "1, or 0 if it failed",
     [](MacroCall& call) -> MacroResult {
       return call.services.RunMacro(PathFromUtf8(call.Text(0))) ? 1 : 0;
     }},
};

}  // namespace

FunctionGroup MacroGroup() { return {"Macro", kFunctions}; }
