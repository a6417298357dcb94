// SPDX-License-Identifier: MIT
// What the program tells its user while macros run, on standard error: for people, or for programs
// one JSON object a line with the member "type" ("error", "message", "test", "trace", "note",
// "profile").
//
// Errors: none; what cannot be written is passed over.
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

  // Whose messages, traces and notes follow, and over which of its texts it is tested, both of which are
  // told with each unless they are empty. Not while a macro runs.
  void SetMacro(std::string name, std::string textCase) {
    macro = std::move(name);
    macroCase = std::move(textCase);
  }

  void Error(Diagnostic error);
  // What a macro says.
  void Message(std::string_view text) { Line("message", "", text); }
  void Trace(std::string_view text) { Line("trace", "", text); }
  // Several lines, each with its end.
  void Profile(std::string_view table);
  // What the program itself has to say.
  void Note(std::string_view text) { Line("note", "macrorun: ", text); }

  // The outcome of that macro's test, with what its text has other than expected. Of one that has passed
  // only programs are told.
  void TestEnd(bool passed, const std::vector<DiffLine>& diff);

  // "[2/10] name" on a line of its own that the next one replaces; on a terminal only.
  void Progress(std::size_t number, std::size_t count, const std::string& name);
  void EndProgress();

 private:
  void Line(const char* type, const char* prefix, std::string_view text);

  const Form form;
  std::string macro, macroCase;
  std::size_t progressWidth = 0;
};
