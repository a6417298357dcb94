// SPDX-License-Identifier: MIT
// The selection, which ends at the cursor.
#include "document/Motion.h"
#include "functions/MacroCall.h"
#include "functions/groups/FunctionGroups.h"

namespace {

using Kind = ParameterKind;

MacroResult Select(MacroCall& call, Range range) {
  call.document().Select(range);
  return 0;
}

MacroResult SelectPlaces(MacroCall& call) {
  const Range range = {call.At(0), call.At(2)};
  if (range.to < range.from) call.Fail(2, "a position that is not before the first");
  return Select(call, range);
}

// Includes the line end, so that deleting the selection deletes the line.
MacroResult SelectLine(MacroCall& call) {
  const std::size_t line = call.LineOrCursor(0);
  const Document& document = call.document();
  return Select(call, {{line, 0}, std::min(Position{line + 1, 0}, document.TextEnd())});
}

MacroResult SelectWord(MacroCall& call) {
  const Range word = WordAround(call.document(), call.document().Cursor());
  if (word.from == word.to) return 0;
  Select(call, word);
  return 1;
}

constexpr ResultKind kNone = ResultKind::kNone, kNumber = ResultKind::kNumber;

const std::vector<MacroFunction> kFunctions = {
    {"select",
     {{"line", Kind::kLineOrEnd},
      {"column", Kind::kColumn},
      {"last_line", Kind::kLineOrEnd},
      {"last_column", Kind::kColumn}},
     kNone,
     "selects from one position to another; the cursor moves to the end",
     SelectPlaces},
    {"select_all",
     {},
     kNone,
     "selects the whole text",
     [](MacroCall& call) { return Select(call, {{}, call.document().TextEnd()}); }},
    {"select_line",
     {{"line", Kind::kLine, "the cursor's"}},
     kNone,
     "selects a line with its line end",
     SelectLine},
    {"select_word",
     {},
     kNumber,
     "selects the word at the cursor; returns 1, or 0 without a word",
     SelectWord},
    {"selection",
     {},
     ResultKind::kText,
     "returns the selected text; a line end is \\n",
     [](MacroCall& call) -> MacroResult {
       return call.document().Text(call.document().Selection());
     }},
    {"has_selection",
     {},
     kNumber,
     "returns 1 when something is selected, otherwise 0",
     [](MacroCall& call) -> MacroResult { return call.document().HasSelection() ? 1 : 0; }},
    {"selection_line",
     {},
     kNumber,
     "returns the line where the selection begins",
     [](MacroCall& call) { return Answer(call.document().Selection().from.line); }},
    {"selection_column",
     {},
     kNumber,
     "returns the column where the selection begins",
     [](MacroCall& call) {
       return Answer(ColumnOf(call.document(), call.document().Selection().from));
     }},
    {"replace_selection",
     {{"text", Kind::kText}},
     kNone,
     "replaces the selection by a text and selects that text",
     [](MacroCall& call) -> MacroResult {
       Document& document = call.document();
       const Position from = document.Selection().from;
       document.Replace({{document.Selection(), call.Text(0)}});
       return Select(call, {from, document.Cursor()});
     }},
    {"clear_selection",
     {},
     kNone,
     "ends the selection; the cursor stays",
     [](MacroCall& call) -> MacroResult {
       call.document().MoveCursor(call.document().Cursor());
       return 0;
     }},
};

}  // namespace

FunctionGroup SelectionGroup() { return {"Selection", kFunctions}; }
