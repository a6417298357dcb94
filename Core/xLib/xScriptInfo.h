// SPDX-License-Identifier: MIT
// The language description: which Active Scripting engine to create, and the templates from which
// the host editor writes a recorded keyboard macro in that language. Docs/description-file.md
// documents every key.
//
// The module keeps two: the default description (built-in values, then the Ruby ones) and the
// current one, read from the description file each time an engine is created. Threading: none.
#pragma once

#include "cLib/cSlots.h"
#include "cLib/cString.h"

class Profile;
struct ScriptInfoRecord;

class xScriptInfo {
 public:
  // All texts empty and all bytes zero; with defaults, SetDefaults() on top.
  explicit xScriptInfo(bool withDefaults);

  SLOTS_FROM(0);
  // Turns \n, \r and \t, in this order, into control characters. There is no escape for a
  // backslash.
  SLOT(0) void Unescape(String& text);
  // Unescape on the five templates from MacroBegin to FunctionPostfix. The escape members keep
  // their backslashes.
  SLOT(1) void UnescapeTemplates();
  SLOT(2) void SetDefaults();
  SLOT(3) ~xScriptInfo() = default;
  // Writes every field but the header; longer texts are cut. False, and nothing, for null.
  SLOT(4) bool CopyToRecord(ScriptInfoRecord* record);
  SLOT(5) bool IsFixCRLF() const { return FixCRLF; }
  SLOT(6) bool IsFixDelimiter() const { return FixDelimiter; }
  SLOT(7) const char* GetLanguage() const { return Language.Text(); }
  SLOT(8) bool IsNoCase() const { return NoCase; }
  // Writes the description without escaping it. NoCase and Description have no key. The result is
  // that of the last write.
  SLOT(9) bool Write(Profile& profile);
  // Reads every key, falling back on `defaults`; never fails.
  SLOT(10) void Read(Profile& profile, const xScriptInfo& defaults);

  String Language;  // ProgID, at most 18 characters after reading
  bool NoCase = false;
  String Description;
  String Extension;
  String MacroBegin;
  String MacroEnd;
  String FunctionPrint;
  String FunctionPrefix;
  String FunctionPostfix;
  String Enter;
  String CRLF;
  String LineFeed;
  String Tick;
  String Quote;
  char OpenBracket = 0;
  char CloseBracket = 0;
  bool FixCRLF = false;
  bool FixDelimiter = false;
};

#if CORE_MICROSOFT_ABI
static_assert(offsetof(xScriptInfo, Language) == 4, "fields follow the table");
static_assert(offsetof(xScriptInfo, NoCase) == 28, "fields follow the table");
static_assert(offsetof(xScriptInfo, Description) == 32, "fields follow the table");
static_assert(offsetof(xScriptInfo, Quote) == 296, "twelve texts in a row");
static_assert(offsetof(xScriptInfo, OpenBracket) == 320, "four bytes in a row");
static_assert(offsetof(xScriptInfo, CloseBracket) == 321, "four bytes in a row");
static_assert(offsetof(xScriptInfo, FixCRLF) == 322, "four bytes in a row");
static_assert(offsetof(xScriptInfo, FixDelimiter) == 323, "four bytes in a row");
static_assert(sizeof(xScriptInfo) == 324, "nothing follows");
#endif

xScriptInfo& CurrentScriptInfo();
xScriptInfo& DefaultScriptInfo();
