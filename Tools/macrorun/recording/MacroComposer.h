// SPDX-License-Identifier: MIT
// Writes recorded steps as a macro of a script language, by the language's templates. Run over the
// same document, the macro leaves what the steps left.
//
// Texts in quotes. A language whose escape of the quote begins with a backslash has, as far as one
// can tell, the backslash escapes that Ruby and JScript share; they write whatever the templates have
// no word for, and what a template would not write as it was typed. (The Ruby templates of a line
// feed and of CR LF make a backslash and a letter; a host that fills them in as they are loses those
// line ends.) In any other language only the templates are used, and a lone carriage return is
// refused.
//
// Adjacent typed text becomes one call, as long as it can pass in one. A step that ends in half a
// line end or half a character keeps its call for itself, since what follows could complete it.
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
  // Fails for a format of typed text that is none.
  explicit MacroComposer(const LanguageTemplates& templates);

  std::string Compose(const std::vector<RecordedStep>& steps);

 private:
  void ReadFormat();
  void AddTyped(const RecordedStep& step);
  void AddCall(const RecordedStep& step);
  void AddLine(const std::string& statement);
  void Flush();
  std::string Written(const StepArgument& argument, const RecordedStep& step) const;
  // One unit of a text: a character, a byte that is part of none, or CR LF.
  std::string Escaped(std::string_view unit, std::string_view before, bool enter,
                      const RecordedStep& step) const;
  std::string BackslashEscaped(std::string_view unit, std::string_view before, bool enter) const;

  const LanguageTemplates templates;
  std::string beforeText, afterText;  // of the format of typed text
  char quote = '\0';                  // around a text; none when the format has none
  bool backslash = false;

  std::string macro;
  std::string typed;  // escaped, and not yet in the macro
  std::size_t typedBytes = 0;
  bool typedOpen = false;  // ends in half of something
};
