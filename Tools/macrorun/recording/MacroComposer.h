// SPDX-License-Identifier: MIT
// Writes recorded steps as a macro of a script language with the language's templates. On the same
// document the macro has the effect of the steps.
//
// Quoted texts: if the template of the quote begins with a backslash, the language is assumed to
// have the backslash escapes that Ruby and JScript share. The composer uses them where there is no
// template, and where a template would change the text. (The Ruby templates of a line feed and of
// CR LF write a backslash and a letter.) In other languages it uses only the templates and refuses
// a lone carriage return.
//
// Adjacent typed text becomes one call, up to the length of an argument. A step that ends inside a
// line end or a character is not joined with the next one, which could complete it.
//
// Errors: UsageError, which names the step, or the description and the key of the template.
// Threading: any thread.
#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "recording/LanguageTemplates.h"
#include "recording/Recording.h"

class MacroComposer {
 public:
  // Fails for an invalid format of typed text.
  explicit MacroComposer(const LanguageTemplates& templates);

  std::string Compose(const std::vector<RecordedStep>& steps);

 private:
  void ReadFormat();
  void AddTyped(const RecordedStep& step);
  void AddCall(const RecordedStep& step);
  void AddLine(const std::string& statement);
  void Flush();
  std::string Written(const StepArgument& argument, const RecordedStep& step) const;
  // One unit of a text: a character, an invalid byte, or CR LF.
  std::string Escaped(std::string_view unit, std::string_view before, bool enter,
                      const RecordedStep& step) const;
  std::string BackslashEscaped(std::string_view unit, std::string_view before, bool enter) const;

  const LanguageTemplates templates;
  std::string beforeText, afterText;  // of the format of typed text
  char quote = '\0';                  // around a text; 0: none
  bool backslash = false;

  std::string macro;
  std::string typed;  // escaped, not yet in the macro
  std::size_t typedBytes = 0;
  bool typedOpen = false;  // ends inside a line end or a character
};
