// SPDX-License-Identifier: MIT
#include "Description.h"

#include <windows.h>

#include <string>

#include "Comparison.h"

double TimeReads(const std::filesystem::path& file) {
  static constexpr const char* kTexts[] = {
      "Language",        "Extension", "MacroBegin", "MacroEnd", "FunctionPrint", "FunctionPrefix",
      "FunctionPostfix", "Enter",     "CRLF",       "LineFeed", "Tick",          "Quote"};
  const std::string name = file.string();
  const double start = Now();
  char text[512];
  DWORD language = 0;
  for (const char* key : kTexts) {
    const DWORD size =
        GetPrivateProfileStringA("Options", key, "x", text, sizeof text, name.c_str());
    if (key == kTexts[0]) language = size;
  }
  for (const char* key : {"NoCase", "FixCRLF", "FixDelimiter"})
    GetPrivateProfileIntA("Options", key, 0, name.c_str());
  return language > 1 ? Now() - start : -1;
}
