// SPDX-License-Identifier: MIT
#include "cLib/StringTokenizer.h"

StringTokenizer::StringTokenizer(const char* text, const char* delimiterChars)
    : source(text), delimiters(delimiterChars), cursor(source.Text()) {
  EnterDelimiters();
}

StringTokenizer::StringTokenizer(const char* text, char delimiter)
    : source(text), delimiters(delimiter), cursor(source.Text()) {
  EnterDelimiters();
}

void StringTokenizer::EnterDelimiters() {
  const char* chars = delimiters.Text();
  for (u32 i = 0; i < delimiters.Length(); ++i) {
    const u8 byte = static_cast<u8>(chars[i]);
    delimiterSet[byte >> 3] = static_cast<u8>(delimiterSet[byte >> 3] | 1 << (byte & 7));
  }
}

bool StringTokenizer::IsDelimiter(char ch) const {
  const u8 byte = static_cast<u8>(ch);
  return ch && (delimiterSet[byte >> 3] >> (byte & 7) & 1);
}

void StringTokenizer::PassDelimiter() {
  foundDelimiter = true;
  lastDelimiter = *cursor++;
}

// Appends the quoted part that starts at the cursor; moves the cursor past it.
void StringTokenizer::TakeQuoted() {
  for (++cursor; *cursor; ++cursor) {
    if (*cursor == quote && *++cursor != quote) return;
    token.AppendChar(*cursor);
  }
}

bool StringTokenizer::NextToken(bool keepEmpty) {
  token.Assign("");
  foundDelimiter = false;
  if (!cursor) return false;
  if (!keepEmpty) {
    while (IsDelimiter(*cursor)) PassDelimiter();
    if (!*cursor) {
      cursor = nullptr;
      return false;
    }
  }
  while (*cursor && (*cursor == quote || !IsDelimiter(*cursor))) {
    if (*cursor == quote)
      TakeQuoted();
    else
      token.AppendChar(*cursor++);
  }
  if (*cursor)
    PassDelimiter();
  else
    cursor = nullptr;
  return true;
}

void StringTokenizer::CheckLayout() {
  static_assert(offsetof(StringTokenizer, source) == 32, "fixed order");
  static_assert(offsetof(StringTokenizer, token) == 56, "fixed order");
  static_assert(offsetof(StringTokenizer, delimiters) == 80, "fixed order");
  static_assert(offsetof(StringTokenizer, quote) == 104, "fixed order");
  static_assert(offsetof(StringTokenizer, cursor) == 108, "fixed order");
  static_assert(offsetof(StringTokenizer, foundDelimiter) == 112, "fixed order");
  static_assert(offsetof(StringTokenizer, lastDelimiter) == 114, "fixed order");
}
