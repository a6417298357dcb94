// SPDX-License-Identifier: MIT
// In place of the system's profile functions, which are not to be fuzzed: every key is absent.
#include "iLib/iProfile.h"

bool Profile::ReadString(String& out, const char*, const char*, const char* defaultText,
                         bool) const {
  out.Assign(defaultText);
  return !out.IsEmpty();
}
bool Profile::ReadBool(const char*, const char*, bool defaultValue) const { return defaultValue; }
bool Profile::WriteString(const char*, const char*, const char*) const { return false; }
bool Profile::WriteInt(i32, const char*, const char*) const { return false; }
