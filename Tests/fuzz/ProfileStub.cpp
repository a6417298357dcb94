// SPDX-License-Identifier: MIT
// In place of the system's profile functions, which are not to be fuzzed: every key is absent.
#include "iLib/iProfile.h"
#include "iLib/iProfileSection.h"

ProfileSection::ProfileSection(const Profile& from, const char* section)
    : profile(from), name(section), loaded(false) {}
bool ProfileSection::ReadString(String& out, const char*, const char* defaultText) const {
  out.Assign(defaultText);
  return !out.IsEmpty();
}
bool ProfileSection::ReadBool(const char*, bool defaultValue) const { return defaultValue; }

bool Profile::WriteString(const char*, const char*, const char*) const { return false; }
bool Profile::WriteInt(i32, const char*, const char*) const { return false; }
