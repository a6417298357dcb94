// SPDX-License-Identifier: MIT
// An error of a macro: from a report of the module, the syntax check of a script engine, or a wrong
// call of a macro function.
//
// Texts are bytes, UTF-8 by convention. Lines and columns count from 1; 0 is unknown. Columns count
// characters after CompleteSource.
// Errors: none. Fields that a text does not contain stay empty.
#pragma once

#include <filesystem>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

struct Diagnostic {
  std::string kind;  // one of the list in Docs/macrorun.md
  std::string file;
  int line = 0;
  int column = 0;
  bool columnInBytes = false;  // as engines count: they get each byte as a character
  std::string message;         // one line
  std::string source;          // the text of the line
  std::vector<std::string> details;
  std::string function;  // for a wrong call, as are the next two
  int argument = 0;      // from 1; 0: no single argument
  std::string expected;
};

// The Ruby engine's name of every macro. It gets the text without the file name.
inline constexpr std::string_view kRubyMacroName = "macro";

// An error without line and column. The path may be empty.
Diagnostic PlainDiagnostic(const char* kind, const std::filesystem::path& file,
                           std::string message);

// The two names of a macro: the one for `execute`, which the module repeats in its reports, and the
// one for the user.
struct MacroName {
  std::string inModule;
  std::string shown;
};

// Parses the module's report of a script error. Returns nothing for other reports.
std::optional<Diagnostic> ParseScriptError(std::string_view report, const MacroName& macro);

// Sets message and details from an engine's description. Skips repetitions of the place and of the
// source line, and replaces the engine's name of the macro by the file.
void SetDescription(Diagnostic& error, std::string_view description);

// Parses a backtrace, "macro:3:in `f'" a line, innermost frame first. Sets line and details of an
// error whose file is known.
void SetCallChain(Diagnostic& error, std::string_view chain);

// Replaces the engine's name of the macro by the file in lines that are warnings of the Ruby
// engine.
std::string WithFile(std::string_view text, const std::string& file);

// Reads the source line from the macro file unless the engine has reported it, and converts the
// column to characters.
void CompleteSource(Diagnostic& error);

// One JSON object without a line end.
std::string DiagnosticAsJson(const Diagnostic& error);

// "file:line:column: ", without the parts that are unknown.
std::string Place(const Diagnostic& error);

// The blanks and the caret below the source line; empty when the column is unknown or beyond it.
std::string CaretLine(const Diagnostic& error);
