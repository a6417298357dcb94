// SPDX-License-Identifier: MIT
// String: the Core library's one text type, an owned, growable, NUL-terminated 8-bit buffer that
// remembers its length and its capacity. All text inside the module is a String or a const char*.
//
// Units: lengths, positions and capacities are bytes. A "blank" is a space or a tab.
// Ownership: every String owns its block; copies are by value.
// Errors: a broken precondition is reported (source "cString") and the operation carries on as its
// comment says. When there is no memory the object stays as it was. No operation reads or writes
// outside its block, whatever its arguments, and a text argument may point into the object's own
// buffer.
// Invariants: length < capacity, text[length] == 0. Some operations leave more zero bytes after the
// terminator, so that a String can end a double-zero-terminated list or hold UTF-16.
// Threading: none; one thread at a time.
//
// The layout is shared with the host editor, which reads argument texts and makes result texts.
#pragma once

#include <stdarg.h>
#include <stddef.h>

#include "cLib/cSlots.h"
#include "cLib/cTypes.h"

#if defined(__GNUC__)
#define STRING_FORMAT(text, arguments) __attribute__((format(printf, text, arguments)))
#else
#define STRING_FORMAT(text, arguments)
#endif

class String {
 public:
  // --- Virtual operations ----------------------------------------------------------------------
  SLOTS_FROM(0);
  SLOT(0) ~String();
  // Inserts one character. Nothing when `pos` is negative or beyond the length. A zero character
  // overwrites the text's visible end but does not lengthen it.
  SLOT(1) void InsertChar(char ch, int pos);
  // Inserts a text before `pos`. Nothing for a null or empty text, a negative position, or a
  // position at or beyond the end of a non-empty string (Append does that).
  SLOT(2) void Insert(const char* s, int pos);
  // Copy of at most `count` characters from `pos`; empty when there are none.
  SLOT(3) String Mid(int pos, u32 count) const;
  // Copy of the rest of the text from `pos`; empty when there is none.
  SLOT(4) String MidFrom(int pos) const;
  // Removes `count` characters at `pos`; up to the end when there are fewer.
  SLOT(5) void Delete(int pos, u32 count);

  // --- Construction ----------------------------------------------------------------------------
  String();
  String(const char* s);  // null gives the empty string; implicit, as texts are passed everywhere
  // The first `n` bytes of `s`; copying stops at a NUL of `s` and the rest are zero bytes. The
  // length is `n`.
  String(const char* s, u32 n);
  String(const String& other);
  explicit String(char ch);
  // `count` copies of `ch`; none when `ch` is 0.
  String(char ch, u32 count);

  // --- Reading ---------------------------------------------------------------------------------
  const char* Text() const { return text; }
  u32 Length() const { return length; }
  u32 Capacity() const { return capacity; }
  u32 GrowBy() const { return growBy; }
  bool IsEmpty() const { return length == 0; }
  void SetPadChar(char ch) { padChar = ch; }

  // --- Assignment and growth -------------------------------------------------------------------
  void Assign(const char* s);  // null assigns the empty string
  String& operator=(const char* s);
  String& operator=(const String& other);
  // Makes the block hold at least `n` bytes beyond the grow step: an absolute size, not one
  // relative to the length. Doubles the grow step on every call, up to 32768. Reported: `n` of 0.
  // False, and nothing changed, when there is no memory.
  bool Reserve(u32 n);
  // Empties the text and makes at least `n` bytes fit. When no new block is needed only the first
  // byte is cleared and the length is left for the caller to set. False, and nothing changed, when
  // there is no memory.
  bool EmptyReserve(u32 n);
  // Appends `len` bytes of `s` (copying stops at a NUL of `s`, the rest are zero bytes), or all of
  // it when `len` is -1; two zero bytes follow the terminator. Reported, without effect: `len`
  // below -1.
  void Append(const char* s, int len = -1);
  void AppendChar(char ch);

  // --- Character access ------------------------------------------------------------------------
  // The character at `index`, the text being extended to it when it is shorter: by a blank when one
  // character is missing, else by the pad character (not at all by a pad character of 0). The
  // reference is to a byte that belongs to no text for a negative index, which is reported, and
  // when there is no memory to extend.
  char& At(int index);
  // Stores `ch` through At and returns the character that was there.
  char SetAt(int index, char ch);

  // --- Formatting ------------------------------------------------------------------------------
  // printf-style; returns Text(). A result of 4096 characters or more is replaced by the format
  // text itself, cut to 4086 characters, and "....". Arguments may be this string's own text.
  const char* Format(const char* fmt, ...) STRING_FORMAT(2, 3);
  const char* FormatV(const char* fmt, va_list args);

  // --- Comparison and search -------------------------------------------------------------------
  // Bytes compared as unsigned: -1, 0 or 1 case-sensitively, else the C runtime's order ignoring
  // case. `prefixOnly` compares only the other text's length. Reported: null `other` (result 1).
  int Compare(const String* other, bool caseSensitive, bool prefixOnly) const;
  // False for null or for another length. Ignoring case follows the C runtime's current locale.
  bool Equals(const char* s, bool caseSensitive) const;
  bool EndsWith(const char* s, bool caseSensitive) const;  // false for null or empty
  // Highest position of `s` that is not below `fromPos`; -1 if there is none.
  int FindReverse(const char* s, int fromPos, bool caseSensitive) const;
  u32 CountChar(char ch) const;
  int FirstNonBlank(int limit) const;  // its index, at most `limit`; -1 when there is none
  u32 SkipBlanks() const;              // index of the first non-blank, the length when none
  bool IsAlpha() const;                // non-empty and every byte passes isalpha
  bool HasHighBit() const;             // any byte of 128 or above
  u32 Hash(u32 modulus, bool caseSensitive) const;  // `modulus` must not be 0

  // --- Editing ---------------------------------------------------------------------------------
  // Removes blanks at both ends. A byte of 128 or above ends the search for blanks.
  void Trim();
  void CollapseBlanks();  // cuts every run of blanks to its first character
  // Removes every byte below 32 as a signed char: control characters and, deliberately, the bytes
  // 128 to 255.
  void RemoveControlChars();
  // Replaces the first occurrence of `needle` at or after `fromPos` by `ch`.
  bool ReplaceFirstWithChar(const char* needle, char ch, u32 fromPos);
  // Replaces the first occurrence only; false when nothing was replaced or the texts are equal.
  bool Substitute(const char* oldText, const char* newText);
  // Replaces every occurrence, never searching replaced text again; returns how many.
  u32 ReplaceAll(const char* needle, const char* replacement);
  // Light reversible masking of text, no security measure. The sum and the difference are modulo
  // 256; SubtractFromChars reports a result of 128 or above. XorChars leaves bytes equal to `k`
  // alone, so that no zero byte arises.
  void AddToChars(u8 k);
  void SubtractFromChars(u8 k);
  void XorChars(u8 k);
  // Takes over `n` bytes of `s` (-1: NUL-terminated; a NUL ends the text in any case) as UTF-8, and
  // writes a second zero byte after the terminator.
  void FromLatin1ToUtf8(const char* s, int n = -1);

  // --- What asks the system (iLib/iString.cpp) --------------------------------------------------
  // Loads string resource `resourceId` of the module (at most 1023 characters) and formats it with
  // the arguments; empty when it is missing.
  explicit String(u32 resourceId, ...);
  // Converts a NUL-terminated text in `codePage`, through a work buffer of 4096 bytes.
  String(const wchar_t* w, u32 codePage);
  // As Format, the format being a string resource of at most 1024 characters. A missing resource is
  // traced and gives the empty string.
  const char* FormatResource(u32 resourceId, ...);
  bool LoadResource(u32 resourceId);
  // The system's English message for GetLastError(). Always false.
  bool FromLastError();
  // The message for `code`; a code of 0 takes GetLastError() and receives it. Always false.
  bool FromError(u32& code);
  void CapitalizeWords();  // first character of each alphanumeric run upper, the rest lower case
  // Convert `n` units (-1: NUL-terminated), writing a second zero byte after the terminator.
  // FromWide uses the active code page, but the system's ANSI code page when that is UTF-8.
  void FromWide(const wchar_t* w, int n = -1);
  void FromUtf16ToUtf8(const wchar_t* w, int n = -1);
  // The buffer then holds UTF-16 and the length is its bytes. On failure the text is empty but the
  // length is `n` + 100, deliberately: callers size their next buffer by it.
  void FromUtf8ToUtf16(const char* s, int n = -1);

 private:
  // Bytes that an operation reads while it changes its own block. Bytes in that block are copied,
  // with two zero bytes at the end; others are used in place.
  class Argument {
   public:
    Argument(const String& owner, const void* source, u32 size);
    ~Argument();
    Argument(const Argument&) = delete;
    Argument& operator=(const Argument&) = delete;

    const char* bytes;  // null when there was no memory for the copy
    u32 size;

   private:
    char* copy = nullptr;
  };

  u32 RoomFrom(const void* place) const;  // bytes to the own block's end, if inside
  u32 TextLength(const char* s, u32 most = kLargestSize) const;  // of an argument
  bool Begin(u32 n);                      // the first block, for `n` characters
  void TakeBlock(char* block, u32 size);  // in place of the old one
  // The block must have room. Recounts the length, up to the first zero byte.
  void ReplaceAt(u32 pos, u32 count, const char* bytes, u32 size);
  void ReplaceEach(u32 occurrences, const Argument& from, const Argument& to, u32 result);
  void DeleteThroughSlot(u32& pos);
  void FromWideIn(u32 codePage, const wchar_t* w, u32 units, u32 room);
  static void CheckLayout();

  u32 growBy = 4;      // extra bytes of every reallocation
  char* text;          // owned block, never null
  u32 length = 0;      // bytes before the terminator
  u32 capacity;        // usable bytes of the block, terminator included
  char padChar = ' ';  // fill of At
};

// A new string: `a`, then `b`.
String operator+(const String& a, const char* b);

inline void String::CheckLayout() {
  static_assert(offsetof(String, growBy) == 4, "the host's strings have it here");
  static_assert(offsetof(String, text) == 8, "the host reads it here");
  static_assert(offsetof(String, length) == 12, "the host reads it here");
  static_assert(offsetof(String, capacity) == 16, "the host's strings have it here");
  static_assert(offsetof(String, padChar) == 20, "the host's strings have it here");
  static_assert(sizeof(String) == 24, "the host's lists hold these");
}
