// SPDX-License-Identifier: MIT
#include "report/Diagnostic.h"

#include <algorithm>
#include <charconv>
#include <fstream>
#include <nlohmann/json.hpp>

#include "platform/Encoding.h"
#include "report/ModuleTexts.h"

namespace {

int Number(std::string_view digits) {
  int value = -1;
  std::from_chars(digits.data(), digits.data() + digits.size(), value);
  return value;
}

std::string_view Trimmed(std::string_view text) {
  const std::size_t end = text.find_last_not_of("\r\n ");
  return text.substr(0, end == text.npos ? 0 : end + 1);
}

// "LINE:COLUMN"; the column counts from 0, -1 is unknown.
void ReadPosition(std::string_view text, Diagnostic& error) {
  const std::size_t colon = text.find(':');
  if (colon == text.npos) return;
  error.line = std::max(Number(text.substr(0, colon)), 0);
  error.column = std::max(Number(text.substr(colon + 1)) + 1, 0);
}

// The text after the place in "macro:3: text"; empty for other lines.
std::string_view TextAfterPlace(std::string_view line) {
  const std::size_t digits = kRubyMacroName.size() + 1;
  if (!line.starts_with(kRubyMacroName) || line.substr(0, digits).back() != ':') return {};
  const std::size_t end = line.find_first_not_of("0123456789", digits);
  if (end == line.npos || !line.substr(end).starts_with(": ")) return {};
  return line.substr(end + 2);
}

// Removes the place from the first line "macro:3: text". In a further line, of a second syntax
// error, and in "from macro:3:in `f'" replaces the engine's name by the file.
std::string WithoutEngineName(std::string_view line, const std::string& file, bool first) {
  const std::string_view after = TextAfterPlace(line);
  if (first && !after.empty()) return std::string(after);
  std::string text(line);
  if (!after.empty()) return text.replace(0, kRubyMacroName.size(), file);
  const std::string from = "from " + std::string(kRubyMacroName) + ":";
  if (const std::size_t place = text.find(from); place != text.npos)
    text.replace(place + 5, kRubyMacroName.size(), file);
  return text;
}

bool IsUnderline(std::string_view line) {
  return line.find_first_not_of(" \t^~") == line.npos;  // true for an empty line
}

bool IsWarning(std::string_view line) { return TextAfterPlace(line).starts_with("warning: "); }

// A backtrace with one frame repeats the place of the error.
void ForgetOwnPlace(Diagnostic& error) {
  if (error.details.size() == 1 && error.details[0].ends_with("in `<main>'")) error.details.clear();
}

std::string LineOf(const std::string& file, int line) {
  std::ifstream stream(PathFromUtf8(file), std::ios::binary);
  std::string text;
  for (int i = 0; i < line; ++i)
    if (!std::getline(stream, text)) return {};
  return std::string(Trimmed(text));
}

bool ContinuesCharacter(char byte) { return (static_cast<unsigned char>(byte) & 0xC0) == 0x80; }

}  // namespace

Diagnostic PlainDiagnostic(const char* kind, const std::filesystem::path& file,
                           std::string message) {
  Diagnostic error;
  error.kind = kind;
  error.file = ToUtf8(file);
  error.message = std::move(message);
  return error;
}

std::optional<Diagnostic> ParseScriptError(std::string_view report, const MacroName& macro) {
  const std::string_view beginning = kScriptErrorReport;
  if (!report.starts_with(beginning)) return {};
  report.remove_prefix(beginning.size());
  if (report.starts_with(kFileMark)) report.remove_prefix(kFileMark.size());
  Diagnostic error;
  error.kind = "script";
  const std::size_t reason = report.find(kReasonMark);
  const std::string_view head = report.substr(0, reason);
  const std::size_t source = head.find(kSourceMark);
  const std::size_t position = head.substr(0, source).rfind(" (");
  if (source == head.npos || position == head.npos) {
    error.message = Trimmed(report);
    return error;
  }
  error.file = head.substr(0, position);
  if (error.file == macro.inModule) error.file = macro.shown;
  ReadPosition(head.substr(position + 2, source - position - 2), error);
  error.source = Trimmed(head.substr(source + kSourceMark.size()));
  if (reason != report.npos) SetDescription(error, report.substr(reason + kReasonMark.size()));
  return error;
}

void SetDescription(Diagnostic& error, std::string_view description) {
  bool first = true;
  while (!description.empty()) {
    const std::size_t end = description.find('\n');
    const std::string_view line = Trimmed(description.substr(0, end));
    description.remove_prefix(end == description.npos ? description.size() : end + 1);
    if (IsUnderline(line) || line == error.source) continue;
    const std::string text = WithoutEngineName(line, error.file, first);
    if (first)
      error.message = text;
    else
      error.details.push_back(text);
    first = false;
  }
  ForgetOwnPlace(error);
}

void SetCallChain(Diagnostic& error, std::string_view chain) {
  while (!chain.empty()) {
    const std::size_t end = std::min(chain.find('\n'), chain.size());
    const std::string_view line = chain.substr(0, end);
    chain.remove_prefix(std::min(end + 1, chain.size()));
    const std::size_t place = std::min(line.find(':'), line.size());
    if (error.details.empty())
      error.line = std::max(Number(line.substr(std::min(place + 1, line.size()))), 0);
    error.details.push_back("\tfrom " + error.file + std::string(line.substr(place)));
  }
  ForgetOwnPlace(error);
}

std::string WithFile(std::string_view text, const std::string& file) {
  std::string result;
  while (!text.empty()) {
    const std::string_view line = text.substr(0, text.find('\n'));
    result += IsWarning(line) ? file + std::string(line.substr(kRubyMacroName.size()))
                              : std::string(line);
    text.remove_prefix(line.size());
    if (text.empty()) break;
    result += '\n';
    text.remove_prefix(1);
  }
  return result;
}

void CompleteSource(Diagnostic& error) {
  if (error.line < 1) return;
  if (error.source.empty()) error.source = LineOf(error.file, error.line);
  if (!error.columnInBytes || error.column < 1) return;
  const std::string_view before =
      std::string_view(error.source).substr(0, static_cast<std::size_t>(error.column - 1));
  error.column -= static_cast<int>(std::count_if(before.begin(), before.end(), ContinuesCharacter));
  error.columnInBytes = false;
}

std::string DiagnosticAsJson(const Diagnostic& error) {
  nlohmann::ordered_json json;
  json["type"] = "error";
  json["kind"] = error.kind;
  if (!error.file.empty()) json["file"] = error.file;
  if (error.line > 0) json["line"] = error.line;
  if (error.line > 0 && error.column > 0) json["column"] = error.column;
  json["message"] = error.message;
  if (!error.source.empty()) json["source"] = error.source;
  if (!error.details.empty()) json["details"] = error.details;
  if (!error.function.empty()) json["function"] = error.function;
  if (error.argument > 0) json["argument"] = error.argument;
  if (!error.expected.empty()) json["expected"] = error.expected;
  return json.dump(-1, ' ', false, nlohmann::json::error_handler_t::replace);
}

std::string Place(const Diagnostic& error) {
  if (error.file.empty()) return {};
  std::string place = error.file + ":";
  if (error.line > 0) place += std::to_string(error.line) + ":";
  if (error.line > 0 && error.column > 0) place += std::to_string(error.column) + ":";
  return place + " ";
}

std::string CaretLine(const Diagnostic& error) {
  if (error.column < 1 || error.source.empty()) return {};
  std::string line;
  std::size_t byte = 0;
  for (int column = 1; column < error.column; ++column) {
    if (byte >= error.source.size()) return {};
    line += error.source[byte] == '\t' ? '\t' : ' ';
    do ++byte;
    while (byte < error.source.size() && ContinuesCharacter(error.source[byte]));
  }
  return line + "^";
}
