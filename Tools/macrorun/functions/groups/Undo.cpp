// SPDX-License-Identifier: MIT
// Undo and redo in the current document. The steps of the running macro are its calls, those before
// it whole macros.
#include "functions/MacroCall.h"
#include "functions/groups/FunctionGroups.h"

namespace {

constexpr ResultKind kNumber = ResultKind::kNumber;

const std::vector<MacroFunction> kFunctions = {
    {"undo",
     {},
     kNumber,
     "takes back the last change; 1, or 0 without one",
     [](MacroCall& call) -> MacroResult { return call.document().Undo() ? 1 : 0; }},
    {"redo",
     {},
     kNumber,
     "makes the change taken back last again; 1, or 0 without one",
     [](MacroCall& call) -> MacroResult { return call.document().Redo() ? 1 : 0; }},
};

}  // namespace

FunctionGroup UndoGroup() { return {"Undo", kFunctions}; }
