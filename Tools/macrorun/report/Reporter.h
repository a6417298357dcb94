// SPDX-License-Identifier: MIT
// Writes messages to standard error: as text, or as JSON, one object a line with the member "type"
// ("error", "message", "test", "trace", "note", "profile").
//
// Errors: none; a failed write is ignored.
// Threading: any thread.
#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "report/Diagnostic.h"
#include "report/TextDiff.h"

class Reporter {
 public:
  enum class Form { kText, kJson };

  explicit Reporter(Form reportForm) : form(reportForm) {}

  // The macro and the test case that the following messages, traces and notes belong to; each one
  // names them unless they are empty. Not while a macro runs.
  void SetMacro(std::string name, std::string textCase) {
    macro = std::move(name);
    macroCase = std::move(textCase);
  }

  void Error(Diagnostic error);
  // A message of a macro.
  void Message(std::string_view text) { Line("message", "", text); }
  void Trace(std::string_view text) { Line("trace", "", text); }
  // The lines of the table end with a line feed.
  void Profile(std::string_view table);
  // A message of this program.
  void Note(std::string_view text) { Line("note", "macrorun: ", text); }

  // The result of the current macro's test, and the differences of its text. A test that passed
  // appears in JSON only.
  void TestEnd(bool passed, const std::vector<DiffLine>& diff);

  // Shows "[2/10] name" on a terminal until the next output.
  void Progress(std::size_t number, std::size_t count, const std::string& name);
  void EndProgress();

 private:
  void Line(const char* type, const char* prefix, std::string_view text);

  const Form form;
  std::string macro, macroCase;
  std::size_t progressWidth = 0;
};
