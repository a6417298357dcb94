// SPDX-License-Identifier: MIT
// One section of a profile file, read in a single pass: the system's profile functions open the file
// for each key. The values are those of Profile. Whatever could differ is left to those functions,
// key by key: question marks and characters that are not printable ASCII, a section too long for
// the buffer, entries without a sign, values with blanks at their ends or unbalanced quotes.
// Threading: any thread.
#pragma once

#include "cLib/cString.h"

class Profile;

class ProfileSection {
 public:
  // Reads the section. Both arguments must outlive this object; the name is ASCII.
  ProfileSection(const Profile& profile, const char* name);
  ProfileSection(const ProfileSection&) = delete;
  ProfileSection& operator=(const ProfileSection&) = delete;

  // As Profile's, without the section's name; nothing is removed.
  bool ReadString(String& out, const char* key, const char* defaultText) const;
  bool ReadBool(const char* key, bool defaultValue) const;

 private:
  static constexpr u32 kEntriesSize = 4096;

  // What the section holds for a key.
  enum class Answer { kUnknown, kAbsent, kValue };
  Answer Find(const char* key, const char*& value) const;
  bool Load();

  const Profile& profile;
  const char* name;
  char entries[kEntriesSize];  // each "key=value" with its terminator, then one more
  bool loaded;
};
