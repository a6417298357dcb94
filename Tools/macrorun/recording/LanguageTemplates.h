// SPDX-License-Identifier: MIT
// How a script language writes a recorded macro, as the module tells its host in the record of
// `version` (Docs/description-file.md has the meaning of each text).
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

// `language` is the module's. Fails, naming the key, when the record had to cut a text of the
// language's description, and for a language of which only the engine is known.
LanguageTemplates TemplatesOf(ScriptModule& module, const Language& language);
