// SPDX-License-Identifier: MIT
#include "cLib/StringDZ.h"

#include <string.h>

#include "cLib/cReport.h"

StringDZ::~StringDZ() = default;

// Appended, not formatted: a text of any length keeps its characters. False: no memory.
bool StringDZ::Fill(String& entry, const char* s, bool numbered) const {
  if (numbered) entry.Format("%d=", entries.Count());
  const u32 start = entry.Length();
  entry.Append(s);
  return entry.Length() - start == strlen(s) && (start != 0) == numbered;
}

void StringDZ::Add(const char* s, bool numbered) {
  if (!s) {
    REPORT_ASSERT("cString", "Null entry");
    return;
  }
  if (!*s) return;
  String* entry = new String();
  if (!entry || !Fill(*entry, s, numbered) || entries.SetAt(entry, entries.Count()) < 0) {
    REPORT_ASSERT("cString", "No memory for the entry");
    delete entry;
  }
}

void StringDZ::AddList(const char* dz) {
  if (!dz) {
    REPORT_ASSERT("cString", "Null list");
    return;
  }
  for (; *dz; dz += strlen(dz) + 1) Add(dz, false);
}

const char* StringDZ::Value(i32 i) const {
  const String* entry = entries.At(i);
  if (!entry) {
    REPORT_ASSERT("cString", "No such entry");
    return nullptr;
  }
  const char* sign = strchr(entry->Text(), '=');
  return sign ? sign + 1 : nullptr;
}

const char* StringDZ::Joined() {
  u32 size = 2;
  for (i32 i = 0; i < entries.Count(); ++i) size = AddSizes(size, entries.At(i)->Length() + 1);
  joined.Assign("");
  const bool fits = joined.Reserve(size);
  for (i32 i = 0; fits && i < entries.Count(); ++i) {
    const String& entry = *entries.At(i);
    joined.Append(entry.Text(), static_cast<int>(entry.Length() + 1));
  }
  joined.Append("");  // an empty list also ends in two zero bytes
  return joined.Text();
}

void StringDZ::Clear() {
  entries.Clear();
  joined.Assign("");
}

void StringDZ::CheckLayout() {
  static_assert(offsetof(StringDZ, mark) == 4, "fixed order");
  static_assert(offsetof(StringDZ, entries) == 8, "fixed order");
  static_assert(offsetof(StringDZ, joined) == 28, "fixed order");
}
