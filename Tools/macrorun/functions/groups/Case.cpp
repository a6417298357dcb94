// SPDX-License-Identifier: MIT
// Upper and lower case, and indentation.
#include <limits>

#include "document/Characters.h"
#include "document/Motion.h"
#include "functions/MacroCall.h"
#include "functions/groups/FunctionGroups.h"

namespace {

using Kind = ParameterKind;

// Changes the selection and keeps it. Without one, changes the word at the cursor and moves after
// it.
MacroResult ChangeCase(MacroCall& call, LetterCase letterCase) {
  Document& document = call.document();
  const bool selected = document.HasSelection();
  if (!selected) document.Select(WordAround(document, document.Cursor()));
  const Range range = document.Selection();
  document.Replace({{range, WithCase(document.Text(range), letterCase)}});
  if (!selected) document.MoveCursor(document.Cursor());
  return range.from != range.to ? 1 : 0;
}

// The lines of the selection or the cursor, without a line that contains only the end of the
// selection.
template <class Change>
MacroResult ChangeLines(MacroCall& call, const Change& change) {
  Document& document = call.document();
  const auto [from, to] = document.Selection();
  const std::size_t last = from.line < to.line && to.offset == 0 ? to.line - 1 : to.line;
  std::vector<Replacement> changes;
  for (std::size_t line = from.line; line <= std::min(last, document.LineCount()); ++line)
    if (!document.Line(line).empty()) changes.push_back(change(line, document.Line(line)));
  document.Replace(changes);
  return 0;
}

MacroResult Indent(MacroCall& call) {
  const std::size_t blanks = call.Number(0, 0);
  if (blanks > 1000) call.Fail(0, "at most 1000 spaces");
  const std::string indent = blanks == 0 ? "\t" : std::string(blanks, ' ');
  return ChangeLines(call, [&](std::size_t line, const std::string&) {
    return Replacement{{{line, 0}, {line, 0}}, indent};
  });
}

MacroResult Unindent(MacroCall& call) {
  const std::size_t blanks = call.Number(0, 8);
  return ChangeLines(call, [&](std::size_t line, const std::string& text) {
    std::size_t length = std::min(text.find_first_not_of(' '), text.size());
    length = length == 0 && text.starts_with('\t') ? 1 : std::min(length, blanks);
    return Replacement{{{line, 0}, {line, length}}, ""};
  });
}

constexpr ResultKind kNone = ResultKind::kNone, kNumber = ResultKind::kNumber;

const std::vector<MacroFunction> kFunctions = {
    {"upper",
     {},
     kNumber,
     "converts the selection or the word at the cursor to upper case; returns 1, or 0 without one",
     [](MacroCall& call) { return ChangeCase(call, LetterCase::kUpper); }},
    {"lower",
     {},
     kNumber,
     "converts the selection or the word at the cursor to lower case; returns 1, or 0 without one",
     [](MacroCall& call) { return ChangeCase(call, LetterCase::kLower); }},
    {"title",
     {},
     kNumber,
     "capitalises the words of the selection or at the cursor; returns 1, or 0 without one",
     [](MacroCall& call) { return ChangeCase(call, LetterCase::kTitle); }},
    {"indent",
     {{"blanks", Kind::kCount, "a tab"}},
     kNone,
     "indents the selection's lines, or the cursor's, by spaces or a tab",
     Indent},
    {"unindent",
     {{"blanks", Kind::kCount, "8"}},
     kNone,
     "unindents the selection's lines, or the cursor's, by a tab or at most that many spaces",
     Unindent},
};

}  // namespace

FunctionGroup CaseGroup() { return {"Case and indent", kFunctions}; }
