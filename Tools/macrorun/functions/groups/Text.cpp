// SPDX-License-Identifier: MIT
// The text, whole or in pieces. One call passes a limited length (MacroFunctions.h). So macros read
// long texts with get_text and a count, and write them with set_text and append_text.
#include <limits>

#include "document/Characters.h"
#include "functions/MacroCall.h"
#include "functions/groups/FunctionGroups.h"

namespace {

using Kind = ParameterKind;

// Stops at 8192 bytes, which are enough to detect that the text is too long for a result.
MacroResult GetText(MacroCall& call) {
  const Document& document = call.document();
  std::size_t left = call.Number(2, std::numeric_limits<std::size_t>::max());
  Position from;
  if (call.Has(0)) from = {call.Number(0), 0};
  if (call.Has(1)) from = call.At(0);
  std::string text;
  for (Position at = from; left > 0 && at < document.TextEnd() && text.size() < 8192;) {
    const Position end = document.EndOfLine(at.line);
    const std::string_view rest = std::string_view(document.Line(at.line)).substr(at.offset);
    const std::size_t length = OffsetOfCharacter(rest, left);
    text += rest.substr(0, length);
    left -= CharacterCount(rest.substr(0, length));
    at.offset += length;
    if (at != end || left == 0 || end == document.TextEnd()) break;
    text += '\n';
    --left;
    at = {at.line + 1, 0};
  }
  return text;
}

MacroResult SetText(MacroCall& call) {
  Document& document = call.document();
  document.Replace({{{{}, document.End()}, call.Text(0)}});
  document.MoveCursor({});
  return 0;
}

constexpr ResultKind kNone = ResultKind::kNone, kNumber = ResultKind::kNumber;

const std::vector<MacroFunction> kFunctions = {
    {"write",
     {{"text", Kind::kText}},
     kNone,
     "replaces the selection by a text, or inserts it at the cursor; the cursor moves after it",
     [](MacroCall& call) -> MacroResult {
       call.document().Write(call.Text(0));
       return 0;
     }},
    {"get_text",
     {{"line", Kind::kLineOrEnd, "1"},
      {"column", Kind::kColumn, "1"},
      {"count", Kind::kCount, "all that follow"}},
     ResultKind::kText,
     "returns the text from a position on",
     GetText},
    {"set_text",
     {{"text", Kind::kText}},
     kNone,
     "replaces the whole text and moves the cursor to its start",
     SetText},
    {"append_text",
     {{"text", Kind::kText}},
     kNone,
     "adds a text at the end",
     [](MacroCall& call) -> MacroResult {
       const Position end = call.document().TextEnd();
       call.document().Replace({{{end, end}, call.Text(0)}});
       return 0;
     }},
    {"text_length",
     {},
     kNumber,
     "returns the number of characters; a line end counts as one",
     [](MacroCall& call) { return Answer(CharacterCount(call.document().Flat().text)); }},
};

}  // namespace

FunctionGroup TextGroup() { return {"Text", kFunctions}; }
