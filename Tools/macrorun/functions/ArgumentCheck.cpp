// SPDX-License-Identifier: MIT
#include "functions/ArgumentCheck.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <cstring>
#include <limits>
#include <optional>

#include "document/Characters.h"
#include "functions/Limits.h"

namespace {

constexpr std::size_t kMost = std::numeric_limits<std::int32_t>::max();

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

ArgumentCheck::ArgumentCheck(const MacroFunction& called, std::span<const HostArgument> given,
                             const Editor* where)
    : function(called), arguments(given), editor(where) {
  CheckCount(given.size());
  for (std::size_t i = 0; i < given.size(); ++i) {
    const std::size_t last = function.parameters.size() - 1;
    const Value value = Check(i, function.parameters[i < last ? i : last].kind);
    if (i <= last)
      values.push_back(value);
    else
      values[last].text += " " + value.text;
    if (i <= last && function.parameters[i].kind == ParameterKind::kWords) Words(i);
  }
}

void ArgumentCheck::CheckCount(std::size_t given) const {
  const std::size_t most = function.parameters.size();
  std::size_t least = 0;
  while (least < most && !function.parameters[least].Optional()) ++least;
  const bool any = most > 0 && function.parameters.back().kind == ParameterKind::kTexts;
  if (any || (given >= least && given <= most)) return;
  const std::string range = (least < most ? std::to_string(least) + " to " : std::string()) +
                            std::to_string(most) + (most == 1 ? " argument " : " arguments ");
  const std::string expected = range + ParameterList(function);
  throw WrongCall(
      function.name, 0, expected,
      std::string(function.name) + ": expected " + expected + ", got " + std::to_string(given));
}

ArgumentCheck::Value ArgumentCheck::Check(std::size_t index, ParameterKind kind) const {
  const std::size_t lines = editor ? editor->Current().LineCount() : kMost;
  switch (kind) {
    case ParameterKind::kLine:
    case ParameterKind::kLastLine: {
      if (lines == 0) Fail(index, "an existing line (the document is empty)");
      const std::size_t first = kind == ParameterKind::kLine ? 1 : values.back().number;
      return {CheckNumber(index, first, lines, "a line number"), {}};
    }
    case ParameterKind::kLineOrEnd:
      return {CheckNumber(index, 1, lines + 1, "a line number"), {}};
    case ParameterKind::kColumn: {
      const std::size_t line = values.back().number;
      return {CheckNumber(index, 1, Length(line) + 1, "a column of line " + std::to_string(line)),
              {}};
    }
    case ParameterKind::kCount:
      return {CheckNumber(index, 0, kMost, "a number"), {}};
    case ParameterKind::kDocument:
      return {CheckNumber(index, 1, editor ? editor->DocumentCount() : kMost,
                          "the number of a document"),
              {}};
    default:
      return {0, CheckText(index, kind)};
  }
}

std::size_t ArgumentCheck::Length(std::size_t line) const {
  if (!editor) return kMost;
  const Document& document = editor->Current();
  return line > document.LineCount() ? 0 : CharacterCount(document.Line(line));
}

std::size_t ArgumentCheck::CheckNumber(std::size_t index, std::size_t first, std::size_t last,
                                       const std::string& what) const {
  last = std::min(last, kMost);
  const std::optional<std::int64_t> number = WholeNumber(arguments[index]);
  if (!number || *number < static_cast<std::int64_t>(first) ||
      *number > static_cast<std::int64_t>(last))
    Fail(index, what + FromTo(first, last));
  return static_cast<std::size_t>(*number);
}

std::string ArgumentCheck::CheckText(std::size_t index, ParameterKind kind) const {
  std::string text(arguments[index].text);
  if (text.size() > kLongestArgument)
    Fail(index, "at most " + std::to_string(kLongestArgument) +
                    " bytes (the text may have been cut; pass it in pieces)");
  if (kind == ParameterKind::kLineText && text.find('\n') != text.npos)
    Fail(index, "one line without a line end");
  if (kind == ParameterKind::kName && text.empty()) Fail(index, "a text that is not empty");
  return text;
}

void ArgumentCheck::Fail(std::size_t index, const std::string& expected) const {
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

void ArgumentCheck::Fail(const std::string& expected) const {
  throw WrongCall(function.name, 0, expected,
                  std::string(function.name) + ": expected " + expected);
}

std::set<std::string_view> ArgumentCheck::Words(std::size_t index) const {
  std::set<std::string_view> words;
  if (!Has(index)) return words;
  std::string_view rest = Text(index);
  while (rest.find_first_not_of(' ') != rest.npos) {
    rest.remove_prefix(rest.find_first_not_of(' '));
    const std::string_view word = rest.substr(0, rest.find(' '));
    rest.remove_prefix(word.size());
    const MacroParameter& parameter = function.parameters[index];
    if (std::find(parameter.words.begin(), parameter.words.end(), word) == parameter.words.end())
      Fail(index, "only words of this list: " + WordList(parameter));
    words.insert(word);
  }
  return words;
}
