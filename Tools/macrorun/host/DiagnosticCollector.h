// SPDX-License-Identifier: MIT
// Parses the module's reports, passes each error once to the reporter, and keeps what decides the
// outcome of a run.
//
// Ownership: the reporter is the caller's. Errors: none. Threading: the run's thread.
#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "report/Diagnostic.h"
#include "report/Reporter.h"

class DiagnosticCollector {
 public:
  // One run, outermost or nested. Its errors count for this run only.
  class Scope {
   public:
    Scope(DiagnosticCollector& owner, MacroName macro) : collector(owner) {
      collector.runs.push_back({std::move(macro), {}, {}, false});
    }
    ~Scope() { collector.runs.pop_back(); }
    Scope(const Scope&) = delete;
    Scope& operator=(const Scope&) = delete;

   private:
    DiagnosticCollector& collector;
  };

  explicit DiagnosticCollector(Reporter& target) : reporter(target) {}

  // The first two inside a scope.
  void Take(std::string_view report) noexcept;
  void Add(Diagnostic error);  // an error from another source
  // The place where a macro was stopped. The first one counts.
  void AddStop(Diagnostic place);
  // The place of the stop; empty when it is unknown.
  Diagnostic Stop() const { return stop; }
  // Reports a failure without a reported error, unless the run was stopped.
  void EndRun(bool stopped);
  bool ErrorSeen() const { return runs.back().errorSeen; }
  // The macro of the current run, for the user.
  const std::string& File() const { return runs.back().macro.shown; }
  // In any run.
  bool Faulted() const { return faulted; }

 private:
  struct Run {
    MacroName macro;
    std::string unknownFunction;  // of the last call, until an error reports it
    std::string followUp;         // "Error parsing" or "Error executing"; a script error says more
    bool errorSeen;
  };

  void TakeScriptError(Diagnostic error);
  static Diagnostic Plain(const char* kind, std::string_view report);

  Reporter& reporter;
  std::vector<Run> runs;
  Diagnostic stop;
  bool faulted = false;
};
