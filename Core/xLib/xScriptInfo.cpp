// SPDX-License-Identifier: MIT
#include "xLib/xScriptInfo.h"

#include <string.h>

#include "iLib/iProfile.h"
#include "iLib/iProfileSection.h"
#include "xLib/ScriptInfoRecord.h"

static constexpr char kSection[] = "Options";
static constexpr u32 kLongestLanguage = 18;

static xScriptInfo currentScriptInfo(false);
static xScriptInfo defaultScriptInfo(true);

xScriptInfo& CurrentScriptInfo() { return currentScriptInfo; }
xScriptInfo& DefaultScriptInfo() { return defaultScriptInfo; }

// The texts and their keys, in the order of the file, after Language.
struct TextKey {
  const char* key;
  String xScriptInfo::*member;
};
static constexpr TextKey kTextKeys[] = {
    {"Extension", &xScriptInfo::Extension},
    {"MacroBegin", &xScriptInfo::MacroBegin},
    {"MacroEnd", &xScriptInfo::MacroEnd},
    {"FunctionPrint", &xScriptInfo::FunctionPrint},
    {"FunctionPrefix", &xScriptInfo::FunctionPrefix},
    {"FunctionPostfix", &xScriptInfo::FunctionPostfix},
    {"Enter", &xScriptInfo::Enter},
    {"CRLF", &xScriptInfo::CRLF},
    {"LineFeed", &xScriptInfo::LineFeed},
    {"Tick", &xScriptInfo::Tick},
    {"Quote", &xScriptInfo::Quote},
};

xScriptInfo::xScriptInfo(bool withDefaults) {
  if (withDefaults) SetDefaults();
}

void xScriptInfo::Unescape(String& text) {
  static constexpr struct {
    const char* escape;
    char control;
  } kEscapes[] = {{"\\n", '\n'}, {"\\r", '\r'}, {"\\t", '\t'}};
  for (const auto& pass : kEscapes)
    while (text.ReplaceFirstWithChar(pass.escape, pass.control, 0)) {
    }
}

void xScriptInfo::UnescapeTemplates() {
  Unescape(MacroBegin);
  Unescape(MacroEnd);
  Unescape(FunctionPrint);
  Unescape(FunctionPrefix);
  Unescape(FunctionPostfix);
}

void xScriptInfo::SetDefaults() {
  Language = "Object Rexx";
  NoCase = false;
  Description = "Object Rexx WSH Version 1.40";
  Extension = "rex";
  MacroBegin = "function key_macro()\\n{";
  MacroEnd = "}\\n\\nkey_macro()   // run the macro";
  FunctionPrint = "\\twrite(\"%s\")";
  FunctionPrefix = "";
  FunctionPostfix = ";";
  Enter = "\\n";
  CRLF = "\\\\n";
  LineFeed = "\\\\r";
  Tick = "'";
  Quote = "\\\"";
  OpenBracket = '(';
  CloseBracket = ')';
  FixCRLF = false;
  FixDelimiter = false;
}

// Fills one field of the record: cuts the text to its width, clears no bytes after the terminator.
template <size_t width>
static void CopyField(char (&field)[width], const String& text) {
  const size_t copied = text.Length() < width ? text.Length() : width - 1;
  memcpy(field, text.Text(), copied);
  field[copied] = 0;
}

bool xScriptInfo::CopyToRecord(ScriptInfoRecord* record) {
  if (!record) return false;
  CopyField(record->description, Description);
  CopyField(record->extension, Extension);
  CopyField(record->macroBegin, MacroBegin);
  CopyField(record->macroEnd, MacroEnd);
  CopyField(record->functionPrint, FunctionPrint);
  CopyField(record->functionPrefix, FunctionPrefix);
  CopyField(record->functionPostfix, FunctionPostfix);
  CopyField(record->enter, Enter);
  CopyField(record->crlf, CRLF);
  CopyField(record->lineFeed, LineFeed);
  CopyField(record->tick, Tick);
  CopyField(record->quote, Quote);
  record->openBracket = OpenBracket;
  record->closeBracket = CloseBracket;
  return true;
}

bool xScriptInfo::Write(Profile& profile) {
  profile.WriteString(Language.Text(), kSection, "Language");
  for (const TextKey& text : kTextKeys)
    profile.WriteString((this->*text.member).Text(), kSection, text.key);
  profile.WriteInt(FixCRLF, kSection, "FixCRLF");
  return profile.WriteInt(FixDelimiter, kSection, "FixDelimiter");
}

void xScriptInfo::Read(Profile& profile, const xScriptInfo& defaults) {
  const ProfileSection section(profile, kSection);
  Description = defaults.Description;
  section.ReadString(Language, "Language", defaults.Language.Text());
  NoCase = section.ReadBool("NoCase", defaults.NoCase);
  Language.Delete(kLongestLanguage, kLargestSize);
  if (!Language.IsEmpty()) Description.Format("%s WSH Version 1.50", Language.Text());
  for (const TextKey& text : kTextKeys)
    section.ReadString(this->*text.member, text.key, (defaults.*text.member).Text());
  FixCRLF = section.ReadBool("FixCRLF", defaults.FixCRLF);
  FixDelimiter = section.ReadBool("FixDelimiter", defaults.FixDelimiter);
  OpenBracket = defaults.OpenBracket;
  CloseBracket = defaults.CloseBracket;
  UnescapeTemplates();
}
