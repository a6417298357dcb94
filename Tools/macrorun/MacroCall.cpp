// SPDX-License-Identifier: MIT
#include "MacroCall.h"

#include <charconv>
#include <cmath>
#include <cstring>
#include <limits>
#include <optional>

#include "Characters.h"
#include "iLib/iComText.h"

namespace {

std::optional<std::int64_t> WholeNumber(const HostArgument& argument) {
  if (argument.kind == kIntegerArgument) return argument.integer;
  if (argument.kind == kRealArgument) {
    if (std::trunc(argument.real) != argument.real || std::fabs(argument.real) > 1e15) return {};
    return static_cast<std::int64_t>(argument.real);
  }
  std::int64_t value = 0;
  const char* end = argument.text + std::strlen(argument.text);
  const auto [rest, error] = std::from_chars(argument.text, end, value);
  if (error != std::errc() || rest != end) return {};
  return value;
}

// "from 1 to 5"
std::string FromTo(std::size_t first, std::size_t last) {
  return " from " + std::to_string(first) + " to " + std::to_string(last);
}

}  // namespace

MacroCall::MacroCall(const MacroFunction& called, Editor& owner, EditorServices& runner,
                     std::span<const HostArgument> given)
    : editor(owner), services(runner), function(called), arguments(given) {
  CheckCount(given.size());
  for (std::size_t i = 0; i < given.size(); ++i) {
    const std::size_t last = function.parameters.size() - 1;
    const Value value = Check(i, function.parameters[i < last ? i : last].kind);
    if (i <= last)
      values.push_back(value);
    else
      values[last].text += " " + value.text;
  }
}

void MacroCall::CheckCount(std::size_t given) const {
  const std::size_t most = function.parameters.size();
  std::size_t least = 0;
  while (least < most && !function.parameters[least].optional) ++least;
  const bool any = most > 0 && function.parameters.back().kind == ParameterKind::kTexts;
  if (any || (given >= least && given <= most)) return;
  const std::string range = (least < most ? std::to_string(least) + " to " : std::string()) +
                            std::to_string(most) + (most == 1 ? " argument " : " arguments ");
  const std::string expected = range + ParameterList(function);
  throw WrongCall(
      function.name, 0, expected,
      std::string(function.name) + ": expected " + expected + ", got " + std::to_string(given));
}

MacroCall::Value MacroCall::Check(std::size_t index, ParameterKind kind) {
  const std::size_t lines = editor.Current().LineCount();
  switch (kind) {
    case ParameterKind::kLine:
    case ParameterKind::kLastLine: {
      if (lines == 0) Fail(index, "a line, but the document has none");
      const std::size_t first = kind == ParameterKind::kLine ? 1 : values.back().number;
      return {CheckNumber(index, first, lines, "a line number"), {}};
    }
    case ParameterKind::kLineOrEnd:
      return {CheckNumber(index, 1, lines + 1, "a line number"), {}};
    case ParameterKind::kColumn: {
      const std::size_t line = values.back().number;
      const std::size_t length = line > lines ? 0 : CharacterCount(editor.Current().Line(line));
      return {CheckNumber(index, 1, length + 1, "a column of line " + std::to_string(line)), {}};
    }
    case ParameterKind::kCount:
      return {CheckNumber(index, 0, std::numeric_limits<std::int32_t>::max(), "a number"), {}};
    case ParameterKind::kDocument:
      return {CheckNumber(index, 1, editor.DocumentCount(), "the number of a document"), {}};
    default:
      return {0, CheckText(index, kind)};
  }
}

std::size_t MacroCall::CheckNumber(std::size_t index, std::size_t first, std::size_t last,
                                   const std::string& what) const {
  const std::optional<std::int64_t> number = WholeNumber(arguments[index]);
  if (!number || *number < static_cast<std::int64_t>(first) ||
      *number > static_cast<std::int64_t>(last))
    Fail(index, what + FromTo(first, last));
  return static_cast<std::size_t>(*number);
}

std::string MacroCall::CheckText(std::size_t index, ParameterKind kind) const {
  std::string text(arguments[index].text);
  if (text.size() >= kNarrowLimit)
    Fail(index, "at most 511 characters (the text may have been cut at 512)");
  if (kind == ParameterKind::kLineText && text.find('\n') != text.npos)
    Fail(index, "one line without a line end");
  if (kind == ParameterKind::kName && text.empty()) Fail(index, "a text that is not empty");
  return text;
}

Position MacroCall::At(std::size_t lineIndex) const {
  const std::size_t line = Number(lineIndex);
  if (line > editor.Current().LineCount()) return {line, 0};
  return {line, OffsetOfCharacter(editor.Current().Line(line), Number(lineIndex + 1) - 1)};
}

std::size_t MacroCall::LineOrCursor(std::size_t index) {
  if (Has(index)) return Number(index);
  const std::size_t line = document().Cursor().line;
  if (line > document().LineCount()) Fail("the cursor in a line, but it stands behind the last");
  return line;
}

std::set<std::string_view> MacroCall::Words(std::size_t index,
                                            std::initializer_list<std::string_view> allowed) {
  std::set<std::string_view> words;
  if (!Has(index)) return words;
  std::string_view rest = values[index].text;
  while (rest.find_first_not_of(' ') != rest.npos) {
    rest.remove_prefix(rest.find_first_not_of(' '));
    const std::string_view word = rest.substr(0, rest.find(' '));
    rest.remove_prefix(word.size());
    std::string list;
    bool known = false;
    for (const std::string_view& candidate : allowed) {
      known = known || word == candidate;
      list += (list.empty() ? "" : ", ") + std::string(candidate);
    }
    if (!known) Fail(index, "words among " + list);
    words.insert(word);
  }
  return words;
}

void MacroCall::Fail(std::size_t index, const std::string& expected) const {
  std::string got;
  if (index < arguments.size()) {
    const std::string text(arguments[index].text);
    const bool cut = text.size() > 40;
    got = ", got \"" + text.substr(0, cut ? OffsetOfCharacter(text, 40) : text.npos) +
          (cut ? "..." : "") + "\"";
  }
  throw WrongCall(function.name, index + 1, expected,
                  std::string(function.name) + ": argument " + std::to_string(index + 1) + " of " +
                      ParameterList(function) + ": expected " + expected + got);
}

void MacroCall::Fail(const std::string& expected) const {
  throw WrongCall(function.name, 0, expected,
                  std::string(function.name) + ": expected " + expected);
}
