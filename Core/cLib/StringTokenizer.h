// SPDX-License-Identifier: MIT
// StringTokenizer: cuts a copy of a text into tokens at delimiter bytes.
//
// Text between quote characters (none until SetQuote) belongs to one token, without its quotes.
// Delimiters in it do not count. A doubled quote in it is one quote; without a closing quote it
// ends with the text. Threading: none; one thread at a time.
#pragma once

#include "cLib/cString.h"
#include "cLib/cTypes.h"

class StringTokenizer {
 public:
  StringTokenizer(const char* text, const char* delimiterChars);
  StringTokenizer(const char* text, char delimiter);
  StringTokenizer(const StringTokenizer&) = delete;
  StringTokenizer& operator=(const StringTokenizer&) = delete;

  void SetQuote(char ch) { quote = ch; }  // 0: none

  // Moves to the next token; false when there is none. With `keepEmpty` every delimiter ends a
  // token, so a text of n delimiters gives n + 1 tokens; otherwise runs of delimiters count as one
  // and those at the ends as none.
  bool NextToken(bool keepEmpty);

  const String& Token() const { return token; }
  bool FoundDelimiter() const { return foundDelimiter; }  // the last call met a delimiter
  bool HasManyDelimiters() const { return manyDelimiters; }
  char LastDelimiter() const { return lastDelimiter; }  // the last one met, 0 before the first

 private:
  void EnterDelimiters();
  bool IsDelimiter(char ch) const;
  void PassDelimiter();
  void TakeQuoted();
  static void CheckLayout();

  u8 delimiterSet[32] = {};  // bit b & 7 of byte b >> 3
  String source;
  String token;
  String delimiters;
  char quote = 0;
  const char* cursor;  // into `source`; null after its last token
  bool foundDelimiter = false;
  bool manyDelimiters = delimiters.Length() > 1;
  char lastDelimiter = 0;
};
