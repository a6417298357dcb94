// SPDX-License-Identifier: MIT
#include "Reporter.h"

#include <nlohmann/json.hpp>

#include "Console.h"

void Reporter::Error(ErrorReport error) {
  EndProgress();
  CompleteSource(error);
  if (form == Form::kJson) {
    WriteError(ErrorAsJson(error) + "\n");
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
  if (form == Form::kJson) {
    const nlohmann::ordered_json json = {{"type", type}, {"text", text}};
    WriteError(json.dump(-1, ' ', false, nlohmann::json::error_handler_t::replace) + "\n");
    return;
  }
  WriteError(prefix + std::string(text) + "\n");
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
