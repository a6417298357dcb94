// SPDX-License-Identifier: MIT
#include "iLib/iProfile.h"

#include <windows.h>

static constexpr u32 kValueBytes = 512;  // terminator included

bool Profile::ReadString(String& out, const char* section, const char* key, const char* defaultText,
                         bool removeKey) const {
  char value[kValueBytes] = "";
  const DWORD copied =
      GetPrivateProfileStringA(section, key, defaultText, value, sizeof value, FileName());
  out.Assign(value);
  if (removeKey) WritePrivateProfileStringA(section, key, nullptr, FileName());
  return copied != 0;
}

bool Profile::ReadBool(const char* section, const char* key, bool defaultValue) const {
  return GetPrivateProfileIntA(section, key, defaultValue, FileName()) != 0;
}

bool Profile::WriteString(const char* text, const char* section, const char* key) const {
  return WritePrivateProfileStringA(section, key, text, FileName()) != 0;
}

bool Profile::WriteInt(i32 value, const char* section, const char* key) const {
  String text;
  text.Format("%ld", static_cast<long>(value));
  return WriteString(text.Text(), section, key);
}
