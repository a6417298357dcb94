// SPDX-License-Identifier: MIT
// Deletes at the cursor. As with the keys, a selection is deleted instead, whatever the count.
#include "document/Motion.h"
#include "functions/MacroCall.h"
#include "functions/groups/FunctionGroups.h"

namespace {

using Kind = ParameterKind;

template <class Step>
MacroResult Delete(MacroCall& call, const Step& step) {
  Document& document = call.document();
  if (!document.HasSelection()) {
    const Position cursor = document.Cursor();
    Position end = cursor;
    for (std::size_t count = call.Number(0, 1); count > 0; --count) {
      const Position next = step(document, end);
      if (next == end) break;
      end = next;
    }
    document.Replace({{{std::min(cursor, end), std::max(cursor, end)}, ""}});
  } else {
    document.Write("");
  }
  return 0;
}

constexpr ResultKind kNone = ResultKind::kNone;
const std::vector<MacroParameter> kCount = {{"count", Kind::kCount, "1"}};
const auto kBackspace = [](MacroCall& call) {
  return Delete(call, [](const Document& document, Position place) {
    return PreviousCharacter(document, place);
  });
};

const std::vector<MacroFunction> kFunctions = {
    {"delete_char", kCount, kNone, "deletes the selection, or characters after the cursor",
     [](MacroCall& call) { return Delete(call, NextCharacter); }},
    {"backspace", kCount, kNone, "deletes the selection, or characters before the cursor",
     kBackspace},
    {"delete_word", kCount, kNone, "deletes the selection, or up to the start of the next word",
     [](MacroCall& call) { return Delete(call, NextWord); }},
    {"delete_selection",
     {},
     kNone,
     "deletes the selection",
     [](MacroCall& call) -> MacroResult {
       if (call.document().HasSelection()) call.document().Write("");
       return 0;
     }},
};

}  // namespace

FunctionGroup DeletingGroup() { return {"Deleting", kFunctions}; }
