// SPDX-License-Identifier: MIT
#include "iLib/iProfileSection.h"

#include <stdlib.h>
#include <string.h>
#include <windows.h>

#include "cLib/cCompat.h"
#include "iLib/iCodePage.h"
#include "iLib/iProfile.h"

static constexpr u32 kLongestValue = 511;  // longer ones are cut by the profile functions
static constexpr u32 kLongestInteger = 9;  // digits that fit whatever they are

static bool IsBlank(char ch) { return ch == ' ' || ch == '\t'; }

static bool IsQuote(char ch) { return ch == '"' || ch == '\''; }

// Both are printable ASCII, so the locale does not matter.
static bool BeginsWith(const char* text, const char* beginning, u32 size) {
  u32 same = 0;
  while (same < size && FoldAscii(text[same]) == FoldAscii(beginning[same])) ++same;
  return same == size;
}

static bool EndsInBlank(const char* text, u32 size) { return size && IsBlank(text[size - 1]); }

ProfileSection::ProfileSection(const Profile& profile, const char* name)
    : profile(profile), name(name), loaded(Load()) {}

// In UTF-16, which the functions compare keys in: a narrowed key could look like another one.
bool ProfileSection::Load() {
  static constexpr u32 kLongestName = 1024;
  wchar_t file[kLongestName];
  wchar_t section[64];
  wchar_t units[kEntriesSize];
  if (!*profile.FileName() ||
      !MultiByteToUtf16(profile.FileName(), -1, file, kLongestName, CP_ACP) ||
      !MultiByteToUtf16(name, -1, section, 64, CP_ACP))
    return false;
  const DWORD size = GetPrivateProfileSectionW(section, units, kEntriesSize, file);
  if (size >= kEntriesSize - 2) return false;
  for (DWORD i = 0; i < size; ++i) {
    // A question mark may replace bytes that are no character in a multi-byte code page.
    if (units[i] != 0 && (units[i] < ' ' || units[i] > '~' || units[i] == '?')) return false;
    entries[i] = static_cast<char>(units[i]);
  }
  entries[size] = 0;  // the last one's terminator is counted
  const char* entry = entries;
  for (; *entry; entry += strlen(entry) + 1)
    if (IsBlank(*entry) || !strchr(entry, '=')) return false;
  return entry == entries + size;  // an empty entry would hide those that follow it
}

// The first entry of a key counts, as it does for the functions.
ProfileSection::Answer ProfileSection::Find(const char* key, const char*& value) const {
  if (!loaded) return Answer::kUnknown;
  const u32 size = static_cast<u32>(strlen(key));
  for (const char* entry = entries; *entry; entry += strlen(entry) + 1) {
    if (!BeginsWith(entry, key, size)) continue;
    if (IsBlank(entry[size])) return Answer::kUnknown;
    if (entry[size] != '=') continue;
    value = entry + size + 1;
    const u32 length = static_cast<u32>(strlen(value));
    const bool plain = length <= kLongestValue && !IsBlank(*value) && !EndsInBlank(value, length);
    return plain ? Answer::kValue : Answer::kUnknown;
  }
  return Answer::kAbsent;
}

// A pair of quotes around the value is not part of it; a lone quote is. False for unbalanced
// quotes: the profile functions decide those.
static bool Unquote(const char*& value, u32& size) {
  if (size < 2 || !IsQuote(value[0])) return true;
  if (value[size - 1] != value[0]) return false;
  ++value;
  size -= 2;
  return true;
}

// Whether the profile functions return this default unchanged.
static bool IsPlainDefault(const char* text) {
  if (!text) return false;
  const u32 size = static_cast<u32>(strlen(text));
  for (u32 i = 0; i < size; ++i)
    if (static_cast<u8>(text[i]) >= 128) return false;
  return size <= kLongestValue && (size == 1 || !IsQuote(*text)) && !EndsInBlank(text, size);
}

bool ProfileSection::ReadString(String& out, const char* key, const char* defaultText) const {
  const char* value = nullptr;
  const Answer answer = Find(key, value);
  u32 size = value ? static_cast<u32>(strlen(value)) : 0;
  if (answer == Answer::kValue && Unquote(value, size)) {
    char text[kLongestValue + 1];
    memcpy(text, value, size);
    text[size] = 0;
    out.Assign(text);
  } else if (answer == Answer::kAbsent && IsPlainDefault(defaultText)) {
    out.Assign(defaultText);
  } else {
    return profile.ReadString(out, name, key, defaultText, false);
  }
  return !out.IsEmpty();
}

bool ProfileSection::ReadBool(const char* key, bool defaultValue) const {
  const char* value = nullptr;
  const Answer answer = Find(key, value);
  if (answer == Answer::kAbsent) return defaultValue;
  if (answer == Answer::kValue) {
    const u32 digits = static_cast<u32>(strspn(value, "0123456789"));
    if (digits && digits <= kLongestInteger && !value[digits]) return atoi(value) != 0;
  }
  return profile.ReadBool(name, key, defaultValue);
}
