// SPDX-License-Identifier: MIT
#include "host/DiagnosticCollector.h"

#include <utility>

#include "functions/MacroFunctions.h"
#include "host/RunningEngines.h"
#include "report/ModuleTexts.h"

namespace {

bool IsFollowUp(std::string_view report) {
  for (std::string_view beginning : kFollowUpReports)
    if (report.starts_with(beginning)) return true;
  return false;
}

}  // namespace

void DiagnosticCollector::Take(std::string_view report) noexcept {
  if (report.starts_with(kFaultReport)) {
    faulted = true;
    Add(Plain("fault", report));
  } else if (std::optional<Diagnostic> error = ParseScriptError(report, runs.back().macro)) {
    error->columnInBytes = true;
    if (error->message == kInterruption)
      AddStop(std::move(*error));
    else
      TakeScriptError(std::move(*error));
  } else if (report.starts_with(kUnknownFunctionReport)) {
    runs.back().unknownFunction = report.substr(kUnknownFunctionReport.size());
  } else if (IsFollowUp(report)) {
    runs.back().followUp = report;
  } else {
    Add(Plain("engine", report));
  }
}

void DiagnosticCollector::TakeScriptError(Diagnostic error) {
  Run& run = runs.back();
  // A macro can catch the error of the unknown name; then this is another error.
  const std::string& unknown = run.unknownFunction;
  const bool names = error.message.empty() || error.message.find(unknown) != std::string::npos;
  if (!unknown.empty() && names) {
    error.function = unknown;
    error.message = NoMacroFunction(unknown);
  }
  run.unknownFunction.clear();
  if (error.message.empty()) error.message = "script error";
  run.errorSeen = true;
  reporter.Error(std::move(error));
}

void DiagnosticCollector::Add(Diagnostic error) {
  Run& run = runs.back();
  if (error.file.empty()) error.file = run.macro.shown;
  run.errorSeen = true;
  reporter.Error(std::move(error));
}

void DiagnosticCollector::AddStop(Diagnostic place) {
  if (stop.file.empty()) stop = std::move(place);
}

void DiagnosticCollector::EndRun(bool stopped) {
  Run& run = runs.back();
  if (!run.followUp.empty() && !run.errorSeen && !stopped) Add(Plain("engine", run.followUp));
}

// The first line is the message.
Diagnostic DiagnosticCollector::Plain(const char* kind, std::string_view report) {
  Diagnostic error;
  error.kind = kind;
  while (!report.empty()) {
    const std::size_t end = report.find('\n');
    std::string_view line = report.substr(0, end);
    report.remove_prefix(end == report.npos ? report.size() : end + 1);
    line = line.substr(0, line.find_last_not_of("\r ") + 1);
    if (line.empty()) continue;
    if (error.message.empty())
      error.message = line;
    else
      error.details.emplace_back(line);
  }
  return error;
}
