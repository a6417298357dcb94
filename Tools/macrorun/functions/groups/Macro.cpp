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
  if (!answer) call.Fail("an answer, but there is none (--answer gives one)");
  return *answer;
}

MacroResult Argument(MacroCall& call) {
  const std::optional<std::string> value = call.services.MacroArgument(call.Text(0));
  if (value) return *value;
  if (!call.Has(1))
    call.Fail(0, "an argument that the macro was given (--arg NAME=VALUE gives one)");
  return call.Text(1);
}

constexpr ResultKind kText = ResultKind::kText;

const std::vector<MacroFunction> kFunctions = {
    {"message",
     {{"text", Kind::kTexts}},
     ResultKind::kNone,
     "shows its texts to the user, with a blank between",
     [](MacroCall& call) -> MacroResult {
       call.services.Message(call.Text(0));
       return 0;
     }},
    {"prompt",
     {{"question", Kind::kText},
      {"default", Kind::kText, "an empty text, and an answer is needed"}},
     kText,
     "asks the user; an empty line, or nobody at a terminal, means the default; the answer",
     Prompt},
    {"argument",
     {{"name", Kind::kName}, {"default", Kind::kText, "the name must have a value"}},
     kText,
     "the value that the macro was given for a name, or the default",
     Argument},
    {"run_macro",
     {{"path", Kind::kName}},
     ResultKind::kNumber,
     "runs the macro at a path from this one's folder over the same documents; 1, or 0 if it "
     "failed",
     [](MacroCall& call) -> MacroResult {
       return call.services.RunMacro(PathFromUtf8(call.Text(0))) ? 1 : 0;
     }},
};

}  // namespace

FunctionGroup MacroGroup() { return {"Macro", kFunctions}; }
