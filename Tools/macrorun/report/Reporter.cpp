// SPDX-License-Identifier: MIT
#include "report/Reporter.h"

#include <nlohmann/json.hpp>

#include "platform/Console.h"

namespace {

void WriteObject(const char* type, const std::string& macro, const std::string& macroCase,
                 const nlohmann::ordered_json& members) {
  nlohmann::ordered_json json = {{"type", type}};
  if (!macro.empty()) json["macro"] = macro;
  if (!macroCase.empty()) json["case"] = macroCase;
  json.update(members);
  WriteError(json.dump(-1, ' ', false, nlohmann::json::error_handler_t::replace) + "\n");
}

Colour ColourOf(DiffLine::Kind kind) {
  switch (kind) {
    case DiffLine::Kind::kMissing:
      return Colour::kError;
    case DiffLine::Kind::kExtra:
      return Colour::kHighlight;
    case DiffLine::Kind::kPlace:
    case DiffLine::Kind::kRemark:
      return Colour::kFaint;
    case DiffLine::Kind::kSame:
      break;
  }
  return Colour::kPlain;
}

}  // namespace

void Reporter::Error(Diagnostic error) {
  EndProgress();
  CompleteSource(error);
  if (form == Form::kJson) {
    WriteError(DiagnosticAsJson(error) + "\n");
    return;
  }
  const std::string place = Place(error);
  WriteError(place.empty() ? "macrorun: " : place, Colour::kHighlight);
  WriteError(error.message + "\n", Colour::kError);
  const std::string caret = CaretLine(error);
  if (!error.source.empty()) WriteError("  " + error.source + "\n");
  if (!caret.empty()) WriteError("  " + caret + "\n", Colour::kHighlight);
  for (const std::string& detail : error.details) WriteError(detail + "\n", Colour::kFaint);
}

void Reporter::Line(const char* type, const char* prefix, std::string_view text) {
  EndProgress();
  if (form == Form::kJson)
    WriteObject(type, macro, macroCase, {{"text", text}});
  else
    WriteError(prefix + macro + (macroCase.empty() ? "" : " (" + macroCase + ")") +
               (macro.empty() ? "" : ": ") + std::string(text) + "\n");
}

void Reporter::TestEnd(bool passed, const std::vector<DiffLine>& diff) {
  if (!passed) EndProgress();
  std::string whole;
  for (const DiffLine& line : diff) {
    if (form == Form::kText) WriteError(line.text + "\n", ColourOf(line.kind));
    whole += line.text + "\n";
  }
  if (form == Form::kText) return;
  nlohmann::ordered_json json = {{"passed", passed}};
  if (!diff.empty()) json["diff"] = whole;
  WriteObject("test", macro, macroCase, json);
}

void Reporter::Progress(std::size_t number, std::size_t count, const std::string& name) {
  if (form == Form::kJson || !IsTerminal(stderr)) return;
  EndProgress();
  const std::string line = "[" + std::to_string(number) + "/" + std::to_string(count) + "] " + name;
  progressWidth = line.size();
  WriteError(line, Colour::kFaint);
}

void Reporter::EndProgress() {
  if (progressWidth > 0) WriteError("\r" + std::string(progressWidth, ' ') + "\r");
  progressWidth = 0;
}

void Reporter::Profile(std::string_view table) {
  if (form == Form::kText) WriteError(table);
  while (form == Form::kJson && !table.empty()) {
    const std::size_t end = table.find('\n');
    Line("profile", "", table.substr(0, end));
    table.remove_prefix(end + 1);
  }
}
