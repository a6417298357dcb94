// SPDX-License-Identifier: MIT
#include "recording/MacroComposer.h"

#include <charconv>
#include <cstdio>
#include <limits>
#include <optional>

#include "document/Characters.h"
#include "functions/Limits.h"
#include "platform/ExitCode.h"

namespace {

std::string_view UnitAt(std::string_view text, std::size_t offset) {
  const std::size_t length =
      text.substr(offset).starts_with("\r\n") ? 2 : CharacterLength(text, offset);
  return text.substr(offset, length);
}

bool IsControl(char byte) { return (byte >= 0 && byte < ' ') || byte == '\x7f'; }

// A CR, which may start a line end, or a byte that may start or continue a character.
bool IsOpen(std::string_view unit) {
  return unit == "\r" || (unit.size() == 1 && (unit[0] & 0x80) != 0);
}

std::string HexEscape(char byte) {
  char text[5];
  std::snprintf(text, sizeof text, "\\x%02X", static_cast<unsigned>(byte) & 0xFF);
  return text;
}

// In VBScript the sign is an operator and 2147483648 is a real.
std::string WrittenInteger(std::int32_t value) {
  return value == std::numeric_limits<std::int32_t>::min() ? "-2147483647-1"
                                                           : std::to_string(value);
}

// The text that a template means in a string with backslash escapes; nothing when that is unknown.
std::optional<std::string> Meaning(const std::string& escape) {
  std::string text;
  for (std::size_t i = 0; i < escape.size(); ++i) {
    if (escape[i] != '\\') {
      text += escape[i];
      continue;
    }
    const std::string_view next = std::string_view(escape).substr(i + 1, 1);
    if (next == "n")
      text += '\n';
    else if (next == "r")
      text += '\r';
    else if (next == "\\" || next == "'" || next == "\"")
      text += next;
    else
      return {};
    ++i;
  }
  return text;
}

}  // namespace

MacroComposer::MacroComposer(const LanguageTemplates& languageTemplates)
    : templates(languageTemplates) {
  ReadFormat();
  const bool quoted = !beforeText.empty() && !afterText.empty() &&
                      beforeText.back() == afterText.front() &&
                      (afterText.front() == '"' || afterText.front() == '\'');
  if (quoted) quote = afterText.front();
  backslash = (quote == '\'' ? templates.tick : templates.quote).starts_with('\\');
}

// Parses the format as printf does.
void MacroComposer::ReadFormat() {
  const std::string& format = templates.functionPrint;
  bool found = false, sound = true;
  for (std::size_t i = 0; i < format.size() && sound; ++i) {
    std::string& part = found ? afterText : beforeText;
    if (format[i] != '%') {
      part += format[i];
      continue;
    }
    const char conversion = ++i < format.size() ? format[i] : '\0';
    sound = conversion == '%' || (conversion == 's' && !found);
    if (conversion == '%') part += '%';
    found |= conversion == 's';
  }
  if (!found || !sound)
    throw UsageError(templates.source +
                     ": FunctionPrint: expected one %s and no other conversion, got " + format);
}

std::string MacroComposer::Compose(const std::vector<RecordedStep>& steps) {
  macro = templates.macroBegin;
  for (const RecordedStep& step : steps)
    if (step.kind == RecordedStep::Kind::kCall)
      AddCall(step);
    else
      AddTyped(step);
  Flush();
  macro += templates.macroEnd;
  if (!macro.ends_with('\n')) macro += '\n';
  return std::move(macro);
}

void MacroComposer::AddTyped(const RecordedStep& step) {
  if (typedOpen) Flush();
  for (std::size_t offset = 0; offset < step.text.size();) {
    const std::string_view unit = UnitAt(step.text, offset);
    // A template may write two bytes for a line end.
    const std::size_t bytes = unit == "\n" ? 2 : unit.size();
    if (typedBytes + bytes > kLongestArgument) Flush();
    typed += Escaped(unit, typed, step.kind == RecordedStep::Kind::kEnter, step);
    typedBytes += bytes;
    typedOpen = IsOpen(unit);
    offset += unit.size();
  }
}

void MacroComposer::Flush() {
  if (!typed.empty()) AddLine(beforeText + typed + afterText);
  typed.clear();
  typedBytes = 0;
  typedOpen = false;
}

// Indents the call like typed text.
void MacroComposer::AddCall(const RecordedStep& step) {
  Flush();
  std::string call = beforeText.substr(0, beforeText.find_first_not_of(" \t"));
  call += templates.functionPrefix + step.function->name + templates.openBracket;
  bool first = true;
  for (const StepArgument& argument : step.arguments) {
    call += (first ? "" : ", ") + Written(argument, step);
    first = false;
  }
  AddLine(call + templates.closeBracket + templates.functionPostfix);
}

void MacroComposer::AddLine(const std::string& statement) {
  macro += statement;
  if (!macro.ends_with('\n')) macro += '\n';
}

std::string MacroComposer::Written(const StepArgument& argument, const RecordedStep& step) const {
  if (const auto* integer = std::get_if<std::int32_t>(&argument)) return WrittenInteger(*integer);
  if (const auto* real = std::get_if<double>(&argument)) {
    char digits[32];
    return std::string(digits, std::to_chars(digits, std::end(digits), *real).ptr);
  }
  if (quote == '\0')
    throw UsageError(step.place + ": \"arguments\": a text needs quotes, and FunctionPrint of " +
                     templates.source + " has none around %s");
  const std::string& text = std::get<std::string>(argument);
  std::string written(1, quote);
  for (std::size_t offset = 0; offset < text.size();) {
    const std::string_view unit = UnitAt(text, offset);
    written += Escaped(unit, written, false, step);
    offset += unit.size();
  }
  return written + quote;
}

std::string MacroComposer::Escaped(std::string_view unit, std::string_view before, bool enter,
                                   const RecordedStep& step) const {
  if (backslash) return BackslashEscaped(unit, before, enter);
  const auto use = [&](const std::string& escape, const char* key) {
    if (!escape.empty()) return escape;
    throw UsageError(step.place + ": " + templates.source + " has no " + key +
                     " template, which this text needs");
  };
  if (enter) return use(templates.enter, "Enter");
  if (unit == "\r\n") return use(templates.crlf, "CRLF");
  if (unit == "\n") return use(templates.lineFeed, "LineFeed");
  if (unit == "'") return use(templates.tick, "Tick");
  if (unit == "\"") return use(templates.quote, "Quote");
  if (unit == "\r")
    throw UsageError(step.place + ": no template for a carriage return without a line feed in " +
                     templates.source);
  return std::string(unit);
}

// `before` is the string so far: in Ruby "#" and one of three characters start an expression.
std::string MacroComposer::BackslashEscaped(std::string_view unit, std::string_view before,
                                            bool enter) const {
  const auto use = [&](const std::string& escape, const char* otherwise) {
    return Meaning(escape) == unit ? escape : std::string(otherwise);
  };
  if (enter)
    return Meaning(templates.enter) == "\r\n" ? templates.enter : use(templates.enter, "\\n");
  if (unit == "\r\n") return use(templates.crlf, "\\r\\n");
  if (unit == "\n") return use(templates.lineFeed, "\\n");
  if (unit == "'") return use(templates.tick, "\\'");
  if (unit == "\"") return use(templates.quote, "\\\"");
  if (unit == "\\") return "\\\\";
  if (unit == "\r") return "\\r";
  if (unit == "\t") return "\\t";
  const bool interpolates = before.ends_with('#') && (unit == "{" || unit == "$" || unit == "@");
  const bool invalid = unit.size() == 1 && (unit[0] & 0x80) != 0;
  if (interpolates || invalid || IsControl(unit[0])) return HexEscape(unit[0]);
  return std::string(unit);
}
