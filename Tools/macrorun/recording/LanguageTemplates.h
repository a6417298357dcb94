// SPDX-License-Identifier: MIT
// The templates for recorded macros of a script language, from the record that the module's
// `version` fills (Docs/description-file.md explains each of them).
//
// Errors: UsageError. Threading: the thread of the module.
#pragma once

#include <string>

#include "host/Language.h"

class ScriptModule;

struct LanguageTemplates {
  std::string source;  // the description file, or the module's name for the language
  std::string macroBegin, macroEnd, functionPrint, functionPrefix, functionPostfix;
  std::string enter, crlf, lineFeed, tick, quote;
  char openBracket = '(', closeBracket = ')';
};

// `language` is the language that the module was loaded for. Fails when only the engine of the
// language is known, and when the record cuts a template; the error names its key.
LanguageTemplates TemplatesOf(ScriptModule& module, const Language& language);
