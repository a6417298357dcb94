// SPDX-License-Identifier: MIT
// Understands the module's reports: passes the errors among them on to the reporter, each once and in
// one form, and tells what they mean for the outcome of a run.
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
  // One run, outermost or nested: its errors count for it alone.
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

  // `countsBytes`: whether the engine counts columns in bytes.
  DiagnosticCollector(Reporter& target, bool countsBytes)
      : reporter(target), columnsInBytes(countsBytes) {}

  // The first two inside a scope.
  void Take(std::string_view report) noexcept;
  void Add(Diagnostic error);  // one that does not come from the module
  // Where a macro was stopped; the first place counts.
  void AddStop(Diagnostic place);
  // For the outcome: with the macro's name alone where the place is not known.
  Diagnostic Stop() const { return stop; }
  // What was held back comes out, unless the run was stopped and so had to fail.
  void EndRun(bool stopped);
  bool ErrorSeen() const { return runs.back().errorSeen; }
  // Of the present run, for the user.
  const std::string& File() const { return runs.back().macro.shown; }
  // In any run.
  bool Faulted() const { return faulted; }

 private:
  struct Run {
    MacroName macro;
    std::string unknownFunction;  // called last and not yet part of an error
    std::string followUp;         // says less than a script error
    bool errorSeen;
  };

  void TakeScriptError(Diagnostic error);
  static Diagnostic Plain(const char* kind, std::string_view report);

  Reporter& reporter;
  const bool columnsInBytes;
  std::vector<Run> runs;
  Diagnostic stop;
  bool faulted = false;
};
