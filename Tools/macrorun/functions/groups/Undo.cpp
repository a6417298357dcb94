// SPDX-License-Identifier: MIT
// Undo and redo in the current document. A step is a call of the running macro, or an earlier
// macro.
#include "functions/MacroCall.h"
#include "functions/groups/FunctionGroups.h"

namespace {

constexpr ResultKind kNumber = ResultKind::kNumber;

const std::vector<MacroFunction> kFunctions = {
    {"undo",
     {},
     kNumber,
     "undoes the last change; returns 1, or 0 if there is none",
     [](MacroCall& call) -> MacroResult { return call.document().Undo() ? 1 : 0; }},
    {"redo",
     {},
     kNumber,
     "redoes the last undone change; returns 1, or 0 if there is none",
     [](MacroCall& call) -> MacroResult { return call.document().Redo() ? 1 : 0; }},
};

}  // namespace

FunctionGroup UndoGroup() { return {"Undo", kFunctions}; }
