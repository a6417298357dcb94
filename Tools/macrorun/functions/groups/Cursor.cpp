// SPDX-License-Identifier: MIT
// Reads and moves the cursor. Moving ends the selection.
#include <algorithm>

#include "document/Characters.h"
#include "document/Motion.h"
#include "functions/MacroCall.h"
#include "functions/groups/FunctionGroups.h"

namespace {

using Kind = ParameterKind;

MacroResult MoveTo(MacroCall& call, Position place) {
  call.document().MoveCursor(place);
  return 0;
}

// Makes up to as many steps as the first argument says; returns how many it made.
template <class Step>
MacroResult Repeat(MacroCall& call, const Step& step) {
  const Document& document = call.document();
  Position place = document.Cursor();
  std::size_t taken = 0;
  for (std::size_t count = call.Number(0, 1); taken < count; ++taken) {
    const Position next = step(document, place);
    if (next == place) break;
    place = next;
  }
  MoveTo(call, place);
  return Answer(taken);
}

// Keeps the column, up to the end of the line.
MacroResult MoveLines(MacroCall& call, bool down) {
  const Document& document = call.document();
  const Position cursor = document.Cursor();
  const std::size_t last = std::max<std::size_t>(1, document.TextEnd().line);
  const std::size_t room = down ? last - std::min(last, cursor.line) : cursor.line - 1;
  const std::size_t count = std::min(room, call.Number(0, 1));
  const std::size_t line = down ? cursor.line + count : cursor.line - count;
  const std::size_t before = ColumnOf(document, cursor) - 1;
  std::size_t offset = 0;
  if (line <= document.LineCount()) offset = OffsetOfCharacter(document.Line(line), before);
  MoveTo(call, {line, offset});
  return Answer(count);
}

const std::vector<MacroParameter> kSteps = {{"count", Kind::kCount, "1"}};
constexpr ResultKind kNone = ResultKind::kNone, kNumber = ResultKind::kNumber;
const auto kLeft = [](MacroCall& call) {
  return Repeat(call, [](const Document& document, Position place) {
    return PreviousCharacter(document, place);
  });
};

const std::vector<MacroFunction> kFunctions = {
    {"cursor_line",
     {},
     kNumber,
     "returns the cursor's line",
     [](MacroCall& call) { return Answer(call.document().Cursor().line); }},
    {"cursor_column",
     {},
     kNumber,
     "returns the cursor's column, in characters",
     [](MacroCall& call) { return Answer(ColumnOf(call.document(), call.document().Cursor())); }},
    {"goto",
     {{"line", Kind::kLineOrEnd}, {"column", Kind::kColumn}},
     kNone,
     "moves the cursor to a line and column",
     [](MacroCall& call) { return MoveTo(call, call.At(0)); }},
    {"goto_line",
     {{"line", Kind::kLineOrEnd}},
     kNone,
     "moves the cursor to the start of a line, or to the end of the text",
     [](MacroCall& call) { return MoveTo(call, {call.Number(0), 0}); }},
    {"line_start",
     {},
     kNone,
     "moves the cursor to the start of its line",
     [](MacroCall& call) { return MoveTo(call, {call.document().Cursor().line, 0}); }},
    {"line_end",
     {},
     kNone,
     "moves the cursor to the end of its line",
     [](MacroCall& call) {
       return MoveTo(call, call.document().EndOfLine(call.document().Cursor().line));
     }},
    {"document_start",
     {},
     kNone,
     "moves the cursor to the start of the text",
     [](MacroCall& call) { return MoveTo(call, {}); }},
    {"document_end",
     {},
     kNone,
     "moves the cursor to the end of the text",
     [](MacroCall& call) { return MoveTo(call, call.document().TextEnd()); }},
    {"cursor_left", kSteps, kNumber, "moves the cursor left by characters; returns how many",
     kLeft},
    {"cursor_right", kSteps, kNumber, "moves the cursor right by characters; returns how many",
     [](MacroCall& call) { return Repeat(call, NextCharacter); }},
    {"cursor_up", kSteps, kNumber, "moves the cursor up by lines; returns how many",
     [](MacroCall& call) { return MoveLines(call, false); }},
    {"cursor_down", kSteps, kNumber, "moves the cursor down by lines; returns how many",
     [](MacroCall& call) { return MoveLines(call, true); }},
    {"word_left", kSteps, kNumber, "moves the cursor left by words; returns how many",
     [](MacroCall& call) { return Repeat(call, PreviousWord); }},
    {"word_right", kSteps, kNumber, "moves the cursor right by words; returns how many",
     [](MacroCall& call) { return Repeat(call, NextWord); }},
};

}  // namespace

FunctionGroup CursorGroup() { return {"Cursor", kFunctions}; }
