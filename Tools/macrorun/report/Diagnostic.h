// SPDX-License-Identifier: MIT
// An error of a macro in one form, wherever it comes from: the module's reports, a script engine's
// syntax check, or a macro function that was called wrongly.
//
// Texts are bytes, UTF-8 by convention. Lines and columns count from 1, columns in characters once the
// source is complete; 0 is unknown.
// Errors: none; what a text does not tell stays empty.
// Threading: values.
#pragma once

#include <filesystem>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

struct Diagnostic {
  std::string kind;  // as the user's guide lists them
  std::string file;
  int line = 0;
  int column = 0;
  bool columnInBytes = false;  // as engines count that take each byte for a character
  std::string message;         // one line
  std::string source;          // the text of the line
  std::vector<std::string> details;
  std::string function;  // of a wrong call, as are the next two
  int argument = 0;      // from 1; 0: not one of them
  std::string expected;
};

// An error without a place. No path: of no file.
Diagnostic PlainDiagnostic(const char* kind, const std::filesystem::path& file,
                           std::string message);

// How a macro is named: in what `execute` is given and the module's reports say, and to the user.
struct MacroName {
  std::string inModule;
  std::string shown;
};

// The module's report of a script error; nothing for another report.
std::optional<Diagnostic> ParseScriptError(std::string_view report, const MacroName& macro);

// An engine's description of an error becomes message and details: what repeats the place or the
// source line is left out, and `file` stands for the name that the engine has for a macro.
void SetDescription(Diagnostic& error, std::string_view description);

// What an engine tells of the calls that led to a place, "macro:3:in `f'" a line, innermost first, becomes
// line and details of an error whose file is known.
void SetCallChain(Diagnostic& error, std::string_view chain);

// In warnings of the Ruby engine, a line each, the macro's file in place of the engine's name for it; other
// lines as they are.
std::string WithFile(std::string_view text, const std::string& file);

// The line's text from the macro file, where the engine has told none, and the column in characters.
void CompleteSource(Diagnostic& error);

// One JSON object without a line end.
std::string DiagnosticAsJson(const Diagnostic& error);

// "file:line:column: " as far as it is known.
std::string Place(const Diagnostic& error);

// The blanks and the caret below the source line; empty when the column is unknown or beyond it.
std::string CaretLine(const Diagnostic& error);
