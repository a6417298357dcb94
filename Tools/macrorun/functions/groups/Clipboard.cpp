// SPDX-License-Identifier: MIT
// The editor's own clipboard, which all documents share. The system's is left alone, so that a run
// depends on nothing but its input.
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
    {"copy", {}, kNumber, "copies the selection; 1, or 0 without one", Copy},
    {"cut",
     {},
     kNumber,
     "copies and deletes the selection; 1, or 0 without one",
     [](MacroCall& call) -> MacroResult {
       const MacroResult copied = Copy(call);
       if (call.document().HasSelection()) call.document().Write("");
       return copied;
     }},
    {"paste",
     {},
     ResultKind::kNone,
     "writes what was copied",
     [](MacroCall& call) -> MacroResult {
       call.document().Write(call.editor.clipboard);
       return 0;
     }},
    {"clipboard",
     {},
     ResultKind::kText,
     "the text that was copied",
     [](MacroCall& call) -> MacroResult { return call.editor.clipboard; }},
};

}  // namespace

FunctionGroup ClipboardGroup() { return {"Clipboard", kFunctions}; }
