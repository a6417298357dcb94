// SPDX-License-Identifier: MIT
// A private-profile (.ini) file: its name and typed operations over the system's profile functions,
// which decide about quotes, blanks, encodings and duplicate keys. Threading: any thread.
#pragma once

#include "cLib/cString.h"

class Profile {
 public:
  // Full path; an empty name is no file: reads give the defaults, writes fail.
  explicit Profile(const char* fileName) : fileName(fileName) {}

  const char* FileName() const { return fileName.Text(); }

  // Reads at most 511 characters into `out`, `defaultText` when the key is absent, and deletes the
  // key afterwards when `removeKey` is set. Whether any character was read.
  bool ReadString(String& out, const char* section, const char* key, const char* defaultText,
                  bool removeKey) const;
  // True for any non-zero integer; a text that is no integer counts as 0.
  bool ReadBool(const char* section, const char* key, bool defaultValue) const;
  bool WriteString(const char* text, const char* section, const char* key) const;
  bool WriteInt(i32 value, const char* section, const char* key) const;

 private:
  String fileName;
};
