// SPDX-License-Identifier: MIT
// A clipboard that all documents share. It is not the system's, so that a run depends only on its
// input.
#include "functions/MacroCall.h"
#include "functions/groups/FunctionGroups.h"

namespace {

MacroResult Copy(MacroCall& call) {
  Document& document = call.document();
  if (!document.HasSelection()) return 0;
  call.editor.clipboard = document.Text(document.Selection());
  return 1;
}

constexpr ResultKind kNumber = ResultKind::kNumber;

const std::vector<MacroFunction> kFunctions = {
    {"copy", {}, kNumber, "copies the selection; returns 1, or 0 without a selection", Copy},
    {"cut",
     {},
     kNumber,
     "copies and deletes the selection; returns 1, or 0 without a selection",
     [](MacroCall& call) -> MacroResult {
       const MacroResult copied = Copy(call);
       if (call.document().HasSelection()) call.document().Write("");
       return copied;
     }},
    {"paste",
     {},
     ResultKind::kNone,
     "inserts the copied text",
     [](MacroCall& call) -> MacroResult {
       call.document().Write(call.editor.clipboard);
       return 0;
     }},
    {"clipboard",
     {},
     ResultKind::kText,
     "returns the copied text",
     [](MacroCall& call) -> MacroResult { return call.editor.clipboard; }},
};

}  // namespace

FunctionGroup ClipboardGroup() { return {"Clipboard", kFunctions}; }
