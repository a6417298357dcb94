// SPDX-License-Identifier: MIT
// Whole lines. A range of lines is given by its first and last line.
#include <algorithm>
#include <numeric>
#include <utility>

#include "document/Characters.h"
#include "functions/MacroCall.h"
#include "functions/groups/FunctionGroups.h"

namespace {

using Kind = ParameterKind;

// A text's lines. A final line end does not start another line, so the empty text has none.
std::vector<std::string> LinesOf(const std::string& text) {
  std::vector<std::string> lines;
  const Document document(text);
  for (std::size_t line = 1; line <= document.LineCount(); ++line)
    lines.push_back(document.Line(line));
  return lines;
}

MacroResult ReplaceLines(MacroCall& call) {
  const std::size_t first = call.Number(0), last = call.Number(1);
  call.document().ReplaceLines(first, last - first + 1, LinesOf(call.Text(2)));
  return 0;
}

MacroResult DeleteLines(MacroCall& call) {
  const std::size_t first = call.Number(0);
  call.document().ReplaceLines(first, call.Number(1, first) - first + 1, {});
  return 0;
}

MacroResult JoinLines(MacroCall& call) {
  std::vector<Replacement> joints;
  const std::string separator = call.Has(2) ? call.Text(2) : " ";
  for (std::size_t line = call.Number(0); line < call.Number(1); ++line)
    joints.push_back({{call.document().EndOfLine(line), {line + 1, 0}}, separator});
  call.document().Replace(joints);
  return 0;
}

MacroResult SplitLine(MacroCall& call) {
  call.document().Replace({{{call.At(0), call.At(0)}, "\n"}});
  return 0;
}

MacroResult DuplicateLine(MacroCall& call) {
  const std::size_t line = call.LineOrCursor(0);
  call.document().ReplaceLines(line + 1, 0, {call.document().Line(line)});
  return 0;
}

// Returns 1, or 0 when there is no line in that direction.
MacroResult MoveLine(MacroCall& call, bool down) {
  const std::size_t line = call.LineOrCursor(0);
  if (line == (down ? call.document().LineCount() : 1)) return 0;
  call.document().ReorderLines(down ? line : line - 1, {1, 0});
  return 1;
}

MacroResult SortLines(MacroCall& call) {
  const auto words = call.Words(2);
  const std::size_t first = call.Number(0), count = call.Number(1) - first + 1;
  std::vector<std::string> keys;
  for (std::size_t i = 0; i < count; ++i) {
    const std::string& line = call.document().Line(first + i);
    keys.push_back(words.contains("ignore_case") ? WithCase(line, LetterCase::kLower) : line);
  }
  std::vector<std::size_t> order(count);
  std::iota(order.begin(), order.end(), std::size_t{0});
  const bool descending = words.contains("descending");
  std::sort(order.begin(), order.end(), [&](std::size_t left, std::size_t right) {
    const int compared =
        descending ? keys[right].compare(keys[left]) : keys[left].compare(keys[right]);
    return compared != 0 ? compared < 0 : left < right;
  });
  std::vector<std::size_t> repeated;
  for (std::size_t i = 1; i < count && words.contains("unique"); ++i)
    if (keys[order[i]] == keys[order[i - 1]]) repeated.push_back(first + i);
  call.document().ReorderLines(first, std::move(order));
  for (auto line = repeated.rbegin(); line != repeated.rend(); ++line)
    call.document().ReplaceLines(*line, 1, {});
  return Answer(count - repeated.size());
}

constexpr ResultKind kNone = ResultKind::kNone, kNumber = ResultKind::kNumber;
const MacroParameter kLine = {"line", Kind::kLine}, kLineOrEnd = {"line", Kind::kLineOrEnd};
const MacroParameter kLineText = {"text", Kind::kLineText};
const MacroParameter kOptionalLine = {"line", Kind::kLine, "the cursor's"};
const MacroParameter kFirst = {"first", Kind::kLine}, kLast = {"last", Kind::kLastLine};

const std::vector<MacroFunction> kFunctions = {
    {"line_count",
     {},
     kNumber,
     "returns the number of lines",
     [](MacroCall& call) { return Answer(call.document().LineCount()); }},
    {"get_line",
     {kLine},
     ResultKind::kText,
     "returns the text of a line without its line end",
     [](MacroCall& call) -> MacroResult { return call.document().Line(call.Number(0)); }},
    {"line_length",
     {kLine},
     kNumber,
     "returns the number of characters of a line",
     [](MacroCall& call) { return Answer(CharacterCount(call.document().Line(call.Number(0)))); }},
    {"set_line",
     {kLine, kLineText},
     kNone,
     "replaces the text of a line",
     [](MacroCall& call) -> MacroResult {
       call.document().ReplaceLines(call.Number(0), 1, {call.Text(1)});
       return 0;
     }},
    {"insert_line",
     {kLineOrEnd, kLineText},
     kNone,
     "inserts a line before another, or after the last",
     [](MacroCall& call) -> MacroResult {
       call.document().ReplaceLines(call.Number(0), 0, {call.Text(1)});
       return 0;
     }},
    {"delete_line", {kLine}, kNone, "deletes a line", DeleteLines},
    {"delete_lines",
     {kFirst, kLast},
     kNone,
     "deletes the lines from the first to the last",
     DeleteLines},
    {"replace_lines",
     {kFirst, kLast, {"text", Kind::kText}},
     kNone,
     "replaces the lines from the first to the last by the lines of a text",
     ReplaceLines},
    {"join_lines",
     {kFirst, kLast, {"separator", Kind::kLineText, "a space"}},
     kNone,
     "joins the lines from the first to the last with a separator",
     JoinLines},
    {"split_line",
     {kLine, {"column", Kind::kColumn}},
     kNone,
     "splits a line before a column",
     SplitLine},
    {"duplicate_line", {kOptionalLine}, kNone, "inserts a copy of a line after it", DuplicateLine},
    {"move_line_up",
     {kOptionalLine},
     kNumber,
     "moves a line up; returns 1, or 0 for the first line",
     [](MacroCall& call) { return MoveLine(call, false); }},
    {"move_line_down",
     {kOptionalLine},
     kNumber,
     "moves a line down; returns 1, or 0 for the last line",
     [](MacroCall& call) { return MoveLine(call, true); }},
    {"sort_lines",
     {kFirst, kLast, {"options", Kind::kWords, "none", {"descending", "ignore_case", "unique"}}},
     kNumber,
     "sorts the lines from the first to the last; returns how many remain",
     SortLines},
};

}  // namespace

FunctionGroup LineGroup() { return {"Lines", kFunctions}; }
