// SPDX-License-Identifier: MIT
#include "MacroFunctions.h"

#include <charconv>
#include <cmath>
#include <cstdio>
#include <cstring>
#include <optional>
#include <vector>

#include "Encoding.h"
#include "iLib/iComText.h"

namespace {

enum class Kind {
  kLine,       // an existing line
  kLineOrEnd,  // an existing line, or the one after the last
  kText,
  kLineText,  // a text without line ends
  kTexts,     // any number of texts; the last parameter
};

struct Parameter {
  const char* name;
  Kind kind;
};

// The checked arguments: no function has more than one line and one text.
struct Values {
  std::size_t line = 0;
  std::string text;
};

struct MacroFunction {
  const char* name;
  std::vector<Parameter> parameters;
  const char* help;
  MacroResult (*run)(Document& document, const Values& values);
};

const MacroFunction kFunctions[] = {
    {"write",
     {{"text", Kind::kText}},
     "inserts text at the cursor and moves the cursor behind it",
     [](Document& document, const Values& values) -> MacroResult {
       document.Write(values.text);
       return 0;
     }},
    {"line_count",
     {},
     "the number of lines",
     [](Document& document, const Values&) -> MacroResult {
       return static_cast<std::int32_t>(document.LineCount());
     }},
    {"get_line",
     {{"line", Kind::kLine}},
     "the text of a line, without its line end",
     [](Document& document, const Values& values) -> MacroResult {
       return document.Line(values.line);
     }},
    {"set_line",
     {{"line", Kind::kLine}, {"text", Kind::kLineText}},
     "replaces the text of a line",
     [](Document& document, const Values& values) -> MacroResult {
       document.SetLine(values.line, values.text);
       return 0;
     }},
    {"goto_line",
     {{"line", Kind::kLineOrEnd}},
     "puts the cursor at the start of a line, or at the end of the text",
     [](Document& document, const Values& values) -> MacroResult {
       document.GoToLine(values.line);
       return 0;
     }},
    {"insert_line",
     {{"line", Kind::kLineOrEnd}, {"text", Kind::kLineText}},
     "inserts a line before another, or after the last",
     [](Document& document, const Values& values) -> MacroResult {
       document.InsertLine(values.line, values.text);
       return 0;
     }},
    {"delete_line",
     {{"line", Kind::kLine}},
     "deletes a line",
     [](Document& document, const Values& values) -> MacroResult {
       document.DeleteLine(values.line);
       return 0;
     }},
    {"message",
     {{"text...", Kind::kTexts}},
     "writes its texts to standard error, with a blank between",
     [](Document&, const Values& values) -> MacroResult {
       std::fprintf(stderr, "%s\n", values.text.c_str());
       return 0;
     }},
};

std::string ParameterList(const MacroFunction& function) {
  std::string list;
  for (const Parameter& parameter : function.parameters)
    list += (list.empty() ? "" : ", ") + std::string(parameter.name);
  return "(" + list + ")";
}

[[noreturn]] void FailArgument(const MacroFunction& function, std::size_t index,
                               const std::string& expected, const HostArgument& argument) {
  const std::string text(argument.text);
  throw WrongCall(std::string(function.name) + ": argument " + std::to_string(index + 1) + " of " +
                  ParameterList(function) + ": expected " + expected + ", got \"" +
                  (text.size() > 40 ? text.substr(0, 40) + "..." : text) + "\"");
}

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

std::size_t LineNumber(const MacroFunction& function, std::size_t index, std::size_t last,
                       const HostArgument& argument) {
  const std::optional<std::int64_t> line = WholeNumber(argument);
  if (last == 0) FailArgument(function, index, "a line, but the document has none", argument);
  if (!line || *line < 1 || *line > static_cast<std::int64_t>(last))
    FailArgument(function, index, "a line number from 1 to " + std::to_string(last), argument);
  return static_cast<std::size_t>(*line);
}

std::string Text(const MacroFunction& function, std::size_t index, Kind kind,
                 const HostArgument& argument) {
  std::string text(argument.text);
  if (text.size() >= kNarrowLimit)
    FailArgument(function, index, "at most 511 characters (the text may have been cut at 512)",
                 argument);
  if (kind == Kind::kLineText && text.find('\n') != text.npos)
    FailArgument(function, index, "one line without a line end", argument);
  return text;
}

void CheckCount(const MacroFunction& function, std::size_t count) {
  const std::size_t expected = function.parameters.size();
  const bool any = expected > 0 && function.parameters.back().kind == Kind::kTexts;
  if (count == expected || any) return;
  throw WrongCall(std::string(function.name) + ": expected " + std::to_string(expected) +
                  (expected == 1 ? " argument " : " arguments ") + ParameterList(function) +
                  ", got " + std::to_string(count));
}

Values CheckArguments(const MacroFunction& function, const Document& document,
                      std::span<const HostArgument> arguments) {
  CheckCount(function, arguments.size());
  Values values;
  for (std::size_t i = 0; i < arguments.size(); ++i) {
    const std::size_t last = function.parameters.size() - 1;
    const Kind kind = function.parameters[i < last ? i : last].kind;
    if (kind == Kind::kLine || kind == Kind::kLineOrEnd)
      values.line =
          LineNumber(function, i, document.LineCount() + (kind == Kind::kLineOrEnd), arguments[i]);
    else
      values.text += (i > last ? " " : "") + Text(function, i, kind, arguments[i]);
  }
  return values;
}

// Why a macro would not receive this text as it is; empty when it would.
std::string Hindrance(const std::string& text, TextPassage passage) {
  const std::size_t length = WideLength(text);
  if (length >= kWideLimit)
    return std::to_string(length) + " characters, and a macro receives at most 1023";
  if (text.find('\0') != text.npos) return "a zero byte, which would end it";
  if (passage == TextPassage::kBytes || LowBytesStay(text)) return {};
  return "a byte from 0x80 to 0x9F, which the system's code page would change on its way to the "
         "macro (in UTF-8, capital umlauts and dashes have one)";
}

void CheckResult(const MacroFunction& function, std::size_t line, const MacroResult& result,
                 TextPassage passage) {
  const std::string* text = std::get_if<std::string>(&result);
  const std::string hindrance = text ? Hindrance(*text, passage) : "";
  if (hindrance.empty()) return;
  throw WrongCall(std::string(function.name) + ": line " + std::to_string(line) + " has " +
                  hindrance);
}

}  // namespace

std::uint32_t MacroFunctionId(std::string_view name) {
  std::uint32_t id = 0;
  for (const MacroFunction& function : kFunctions) {
    ++id;
    if (name.size() == std::strlen(function.name) &&
        _strnicmp(name.data(), function.name, name.size()) == 0)
      return id;
  }
  return kUnknownId;
}

MacroResult CallMacroFunction(std::uint32_t id, Document& document,
                              std::span<const HostArgument> arguments, TextPassage passage) {
  if (id < 1 || id > std::size(kFunctions))
    throw WrongCall("call of macro function " + std::to_string(id) + ", which does not exist");
  const MacroFunction& function = kFunctions[id - 1];
  const Values values = CheckArguments(function, document, arguments);
  MacroResult result = function.run(document, values);
  CheckResult(function, values.line, result, passage);
  return result;
}

std::string MacroFunctionHelp() {
  std::string help;
  for (const MacroFunction& function : kFunctions) {
    std::string call = "  " + (function.name + ParameterList(function));
    call.resize(28, ' ');
    help += call + function.help + "\n";
  }
  return help;
}
