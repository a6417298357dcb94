// SPDX-License-Identifier: MIT
// Named positions, which move with the text. Each document has its own marks.
#include "functions/MacroCall.h"
#include "functions/groups/FunctionGroups.h"

namespace {

const std::vector<MacroParameter> kName = {{"name", ParameterKind::kName}};
constexpr ResultKind kNone = ResultKind::kNone, kNumber = ResultKind::kNumber;

const std::vector<MacroFunction> kFunctions = {
    {"set_mark", kName, kNone, "sets a mark at the cursor; it moves with the text",
     [](MacroCall& call) -> MacroResult {
       call.document().SetMark(call.Text(0));
       return 0;
     }},
    {"goto_mark", kName, kNumber, "moves the cursor to a mark; returns 1, or 0 without such a mark",
     [](MacroCall& call) -> MacroResult {
       const std::optional<Position> mark = call.document().Mark(call.Text(0));
       if (mark) call.document().MoveCursor(*mark);
       return mark ? 1 : 0;
     }},
    {"delete_mark", kName, kNumber, "deletes a mark; returns 1, or 0 without such a mark",
     [](MacroCall& call) -> MacroResult {
       return call.document().DeleteMark(call.Text(0)) ? 1 : 0;
     }},
};

}  // namespace

FunctionGroup MarkGroup() { return {"Marks", kFunctions}; }
