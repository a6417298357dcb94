// SPDX-License-Identifier: MIT
// StringDZ: a list of texts that can be had as one double-zero-terminated block.
//
// Ownership: the list owns its entries. Errors: broken preconditions are reported (source
// "cString") and nothing is done. Threading: none; one thread at a time.
#pragma once

#include "cLib/cArray.h"
#include "cLib/cSlots.h"
#include "cLib/cString.h"
#include "cLib/cTypes.h"

class StringDZ {
 public:
  SLOTS_FROM(0);
  SLOT(0) ~StringDZ();
  StringDZ() = default;
  StringDZ(const StringDZ&) = delete;
  StringDZ& operator=(const StringDZ&) = delete;

  // Appends `s`, or its number in the list, "=" and `s` when `numbered`. An empty text is ignored.
  // Reported: null.
  void Add(const char* s, bool numbered);
  // Adds every text of a double-zero-terminated block. Reported: null.
  void AddList(const char* dz);

  i32 Count() const { return entries.Count(); }
  const String* Entry(i32 i) const { return entries.At(i); }  // null when there is none
  // The text after the first '=' of an entry; null when it has none. Reported: no such entry.
  const char* Value(i32 i) const;

  // The entries, each with its terminator, then one more zero byte. Valid until the list changes;
  // the empty list when there is no memory.
  const char* Joined();

  void Clear();

 private:
  static void CheckLayout();
  bool Fill(String& entry, const char* s, bool numbered) const;

  [[maybe_unused]] u32 mark = 170;  // constant; marks a live list in a memory dump
  Array<String> entries;
  String joined;
};
