// SPDX-License-Identifier: MIT
#include "recording/LanguageTemplates.h"

#include <windows.h>

#include "host/ScriptModule.h"
#include "platform/Encoding.h"
#include "platform/ExitCode.h"
#include "xLib/ScriptInfoRecord.h"

namespace {

constexpr std::size_t kLongestValue = 4096;

// Replaces \n, \r and \t, as the module does in the templates of whole lines.
std::string Unescaped(const std::string& value) {
  std::string text;
  for (std::size_t i = 0; i < value.size(); ++i) {
    const std::string_view two = std::string_view(value).substr(i, 2);
    const char control = two == "\\n" ? '\n' : two == "\\r" ? '\r' : two == "\\t" ? '\t' : '\0';
    text += control ? control : value[i];
    i += control != '\0';
  }
  return text;
}

class TemplateReader {
 public:
  TemplateReader(std::string sourceName, const Language& language)
      : source(std::move(sourceName)), description(language.description) {}

  template <std::size_t width>
  std::string Line(const char (&field)[width], const char* key) const {
    return Read(field, width - 1, key, Unescaped);
  }
  template <std::size_t width>
  std::string Escape(const char (&field)[width], const char* key) const {
    return Read(field, width - 1, key, [](const std::string& value) { return value; });
  }

 private:
  // A text that fills its field may be cut, so it is compared with the description.
  template <class Decode>
  std::string Read(const char* field, std::size_t longest, const char* key,
                   const Decode& decode) const {
    const std::string text(field);
    if (text.size() == longest && decode(ValueOf(key, text)) != text)
      throw UsageError(source + ": " + key + " is longer than the " + std::to_string(longest) +
                       " characters that the module passes on");
    return text;
  }

  std::string ValueOf(const char* key, const std::string& otherwise) const {
    if (description.empty()) return otherwise;
    const std::wstring wideKey(key, key + std::char_traits<char>::length(key));
    std::wstring value(kLongestValue, L'\0');
    value.resize(GetPrivateProfileStringW(L"Options", wideKey.c_str(), L"", value.data(),
                                          static_cast<DWORD>(value.size()),
                                          std::filesystem::absolute(description).c_str()));
    return ToAnsi(value);
  }

  const std::string source;
  const std::filesystem::path& description;
};

}  // namespace

LanguageTemplates TemplatesOf(ScriptModule& module, const Language& language) {
  ScriptInfoRecord record;
  if (!module.FillRecord(record)) throw UsageError("the module provides no templates");
  if (language.description.empty() && !language.IsRuby())
    throw UsageError("--engine " + language.engine +
                     " has no templates for a macro; use --description instead");
  LanguageTemplates templates;
  templates.source =
      language.description.empty() ? record.description : ToUtf8(language.description);
  const TemplateReader reader(templates.source, language);
  templates.macroBegin = reader.Line(record.macroBegin, "MacroBegin");
  templates.macroEnd = reader.Line(record.macroEnd, "MacroEnd");
  templates.functionPrint = reader.Line(record.functionPrint, "FunctionPrint");
  templates.functionPrefix = reader.Line(record.functionPrefix, "FunctionPrefix");
  templates.functionPostfix = reader.Line(record.functionPostfix, "FunctionPostfix");
  templates.enter = reader.Escape(record.enter, "Enter");
  templates.crlf = reader.Escape(record.crlf, "CRLF");
  templates.lineFeed = reader.Escape(record.lineFeed, "LineFeed");
  templates.tick = reader.Escape(record.tick, "Tick");
  templates.quote = reader.Escape(record.quote, "Quote");
  templates.openBracket = record.openBracket;
  templates.closeBracket = record.closeBracket;
  return templates;
}
