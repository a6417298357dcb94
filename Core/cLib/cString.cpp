// SPDX-License-Identifier: MIT
#include "cLib/cString.h"

#include <ctype.h>
#include <stdio.h>
#include <string.h>

#include "cLib/cCompat.h"
#include "cLib/cMemory.h"
#include "cLib/cReport.h"

static constexpr u32 kFirstRoom = 5;         // bytes of a first block beyond its text
static constexpr u32 kGrowByLimit = 20240;   // the grow step doubles while it is below this
static constexpr u32 kLargeCapacity = 1024;  // blocks above this grow by another 30%
static constexpr u32 kFormatSize = 4096;
static constexpr u32 kFormatShown = 4086;  // characters of a format shown for an over-long result

// The block of a string whose constructor found no memory, so that `text` is never null. Its
// capacity is given as 1: whatever writes more than the terminator then asks for a block first.
static char noMemoryBlock[8];

// Where At points when there is no such character.
static char& NoCharacter() {
  static char character;
  character = 0;
  return character;
}

static bool IsBlank(char ch) { return ch == ' ' || ch == '\t'; }

static int Lower(char ch) { return tolower(static_cast<u8>(ch)); }

static bool SameBytes(const char* a, const char* b, u32 size, bool caseSensitive) {
  if (caseSensitive) return memcmp(a, b, size) == 0;
  for (u32 i = 0; i < size; ++i)
    if (Lower(a[i]) != Lower(b[i])) return false;
  return true;
}

static u32 LengthOf(const char* s) { return static_cast<u32>(strlen(s)); }

// --- Blocks and arguments ----------------------------------------------------------------------

String::Argument::Argument(const String& owner, const void* source, u32 bytesWanted)
    : bytes(static_cast<const char*>(source)), size(bytesWanted) {
  const u32 room = owner.RoomFrom(source);
  if (!room) return;
  if (size > room) size = room;
  copy = static_cast<char*>(AllocateBlock(AddSizes(size, 2)));
  bytes = copy;
  if (!copy) return;
  memcpy(copy, source, size);
  copy[size] = copy[size + 1] = 0;
}

String::Argument::~Argument() { ReleaseBlock(copy); }

u32 String::RoomFrom(const void* place) const {
  const uintptr_t offset = reinterpret_cast<uintptr_t>(place) - reinterpret_cast<uintptr_t>(text);
  return offset < capacity ? capacity - static_cast<u32>(offset) : 0;
}

u32 String::TextLength(const char* s, u32 most) const {
  if (!s) return 0;
  const u32 room = RoomFrom(s);
  return static_cast<u32>(strnlen(s, room && room < most ? room : most));
}

bool String::Begin(u32 n) {
  text = static_cast<char*>(AllocateBlock(AddSizes(n, kFirstRoom)));
  if (!text) {
    text = noMemoryBlock;
    capacity = 1;
    return false;
  }
  capacity = n + kFirstRoom;
  length = n;
  memset(text + n, 0, kFirstRoom);
  return true;
}

void String::TakeBlock(char* block, u32 size) {
  if (text != noMemoryBlock) ReleaseBlock(text);
  text = block;
  capacity = size;
}

void String::ReplaceAt(u32 pos, u32 count, const char* bytes, u32 size) {
  memmove(text + pos + size, text + pos + count, length - pos - count + 1);
  memcpy(text + pos, bytes, size);
  length = LengthOf(text);
}

// --- Construction --------------------------------------------------------------------------------

String::~String() { TakeBlock(nullptr, 0); }

String::String() { Begin(0); }

String::String(const char* s) {
  const u32 n = s ? LengthOf(s) : 0;
  if (Begin(n) && n) memcpy(text, s, n);
}

String::String(const char* s, u32 n) {
  if (!Begin(s ? n : 0) || !s) return;
  const size_t copied = strnlen(s, n);
  memcpy(text, s, copied);
  memset(text + copied, 0, n - copied);
}

String::String(const String& other) {
  if (Begin(other.length)) memcpy(text, other.text, other.length);
}

String::String(char ch) {
  Begin(0);
  AppendChar(ch);
}

String::String(char ch, u32 count) {
  if (!ch) count = 0;
  if (Begin(count)) memset(text, ch, count);
}

// --- Assignment and growth -----------------------------------------------------------------------

void String::Assign(const char* s) {
  const Argument from(*this, s, TextLength(s));
  if (s && !from.bytes) return;
  if (from.size >= capacity) {
    const u32 wanted = AddSizes(AddSizes(growBy, 1), from.size);
    char* block = static_cast<char*>(AllocateBlock(wanted));
    if (!block) return;
    TakeBlock(block, wanted);
  }
  if (from.size) memcpy(text, from.bytes, from.size);
  text[from.size] = 0;
  length = from.size;
}

String& String::operator=(const char* s) {
  Assign(s);
  return *this;
}

String& String::operator=(const String& other) {
  Assign(other.text);
  return *this;
}

bool String::Reserve(u32 n) {
  if (n == 0) {
    REPORT_ASSERT("cString", "Reserve of nothing");
    return false;
  }
  u32 need = AddSizes(AddSizes(growBy, 1), n);
  if (capacity < need) {
    if (capacity > kLargeCapacity) need = AddSizes(need, need / 10 * 3 + need % 10 * 3 / 10);
    char* block = static_cast<char*>(AllocateBlock(AddSizes(need, 1)));
    if (!block) return false;
    memcpy(block, text, length + 1);
    block[length + 1] = block[length + 2] = 0;  // what follows a terminator stays zero
    TakeBlock(block, need);
  }
  if (growBy < kGrowByLimit) growBy *= 2;
  return true;
}

bool String::EmptyReserve(u32 n) {
  if (AddSizes(growBy, n) >= capacity) {
    const u32 wanted = AddSizes(AddSizes(growBy, 1), n);
    char* block = static_cast<char*>(AllocateBlock(wanted));
    if (!block) return false;
    TakeBlock(block, wanted);
    length = 0;
  }
  text[0] = 0;
  return true;
}

void String::Append(const char* s, int len) {
  if (len < -1) {
    REPORT_ASSERT("cString", "Append of a negative length");
    return;
  }
  if (!s || len == 0) return;
  if (capacity <= length) {
    REPORT_ASSERT("cString", "Length beyond capacity");
    return;
  }
  const u32 copied = TextLength(s, len == -1 ? kLargestSize : static_cast<u32>(len));
  const u32 added = len == -1 ? copied : static_cast<u32>(len);
  const Argument from(*this, s, copied);
  if (!from.bytes) return;
  if (capacity - length - 1 <= AddSizes(added, 3) &&
      !Reserve(AddSizes(AddSizes(added, capacity), 1)))
    return;
  char* end = text + length;
  memcpy(end, from.bytes, copied);
  memset(end + copied, 0, added - copied + 3);
  length += added;
}

void String::AppendChar(char ch) {
  if (capacity <= length) {
    REPORT_ASSERT("cString", "Length beyond capacity");
    return;
  }
  if (capacity - length - 1 < 2 && !Reserve(AddSizes(capacity, 1))) return;
  text[length++] = ch;
  text[length] = 0;
}

String operator+(const String& a, const char* b) {
  String sum(a.Text());
  sum.Append(b);
  return sum;
}

// --- Character access ----------------------------------------------------------------------------

char& String::At(int index) {
  if (index < 0) {
    REPORT_ASSERT("cString", "Negative index");
    return NoCharacter();
  }
  const u32 place = static_cast<u32>(index);
  if (place >= length) {
    if (place >= capacity && !Reserve(place)) return NoCharacter();
    const u32 missing = place - length + 1;
    if (missing == 1)
      AppendChar(' ');
    else
      Append(String(padChar, missing).text);
    // The terminator itself is never given out: a character written there would not be terminated.
    if (place == length) return NoCharacter();
  }
  return text[place];
}

char String::SetAt(int index, char ch) {
  char& place = At(index);
  const char previous = place;
  place = ch;
  return previous;
}

void String::InsertChar(char ch, int pos) {
  if (pos < 0 || static_cast<u32>(pos) > length) return;
  if (capacity - length < 3 && !Reserve(AddSizes(capacity, 2))) return;
  char* place = text + pos;
  memmove(place + 1, place, length - static_cast<u32>(pos) + 1);
  *place = ch;
  if (ch) ++length;
  text[length] = 0;
}

void String::Insert(const char* s, int pos) {
  if (!s || !*s || pos < 0) return;
  const u32 place = static_cast<u32>(pos);
  if (place >= length && place != 0) return;
  const Argument from(*this, s, TextLength(s));
  if (!from.bytes) return;
  if (capacity - length <= from.size && !Reserve(AddSizes(AddSizes(from.size, capacity), 1)))
    return;
  ReplaceAt(place, 0, from.bytes, from.size);
}

void String::Delete(int pos, u32 count) {
  if (pos < 0) return;
  const u32 place = static_cast<u32>(pos);
  if (place >= length && place != 0) return;
  if (count >= length - place)
    text[place] = 0;
  else
    memmove(text + place, text + place + count, length - place - count + 1);
  length = LengthOf(text);
}

String String::Mid(int pos, u32 count) const {
  String result;
  if (pos < 0 || static_cast<u32>(pos) >= length) return result;
  const u32 rest = length - static_cast<u32>(pos);
  const String piece(text + pos, count < rest ? count : rest);
  result.Assign(piece.text);
  return result;
}

String String::MidFrom(int pos) const {
  if (pos < 0 || (static_cast<u32>(pos) >= length && pos != 0)) return String();
  return String(text + pos);
}

// --- Formatting ----------------------------------------------------------------------------------

const char* String::Format(const char* fmt, ...) {
  va_list args;
  va_start(args, fmt);
  FormatV(fmt, args);
  va_end(args);
  return text;
}

const char* String::FormatV(const char* fmt, va_list args) {
  char work[kFormatSize];
  const int written = fmt ? vsnprintf(work, sizeof work, fmt, args) : -1;
  u32 size = static_cast<u32>(written);
  if (written < 0 || size >= kFormatSize) {
    size = TextLength(fmt, kFormatShown);
    if (size) memcpy(work, fmt, size);
    memcpy(work + size, "....", 4);
    size += 4;
  }
  if (!EmptyReserve(size + 1)) return text;
  memcpy(text, work, size);
  text[size] = 0;
  length = size;
  return text;
}

// --- Comparison and search -----------------------------------------------------------------------

int String::Compare(const String* other, bool caseSensitive, bool prefixOnly) const {
  if (!other) {
    REPORT_ASSERT("cString", "Comparison with null");
    return 1;
  }
  if (!caseSensitive)
    return prefixOnly ? CompareIgnoringCase(text, other->text, other->length)
                      : CompareIgnoringCase(text, other->text);
  const int order =
      prefixOnly ? strncmp(text, other->text, other->length) : strcmp(text, other->text);
  return (order > 0) - (order < 0);
}

bool String::Equals(const char* s, bool caseSensitive) const {
  return s && TextLength(s) == length && SameBytes(text, s, length, caseSensitive);
}

bool String::EndsWith(const char* s, bool caseSensitive) const {
  const u32 n = TextLength(s);
  return n != 0 && n <= length && SameBytes(text + length - n, s, n, caseSensitive);
}

int String::FindReverse(const char* s, int fromPos, bool caseSensitive) const {
  const u32 n = TextLength(s);
  if (fromPos < 0 || n == 0 || n > length) return -1;
  for (u32 end = length - n + 1; end > static_cast<u32>(fromPos); --end)
    if (SameBytes(text + end - 1, s, n, caseSensitive)) return static_cast<int>(end - 1);
  return -1;
}

u32 String::CountChar(char ch) const {
  u32 count = 0;
  for (u32 i = 0; i < length; ++i) count += text[i] == ch;
  return count;
}

int String::FirstNonBlank(int limit) const {
  const u32 first = SkipBlanks();
  return limit >= 0 && first < length && first <= static_cast<u32>(limit) ? static_cast<int>(first)
                                                                          : -1;
}

u32 String::SkipBlanks() const {
  u32 i = 0;
  while (IsBlank(text[i])) ++i;  // up to the terminator at the latest
  return i;
}

bool String::IsAlpha() const {
  for (u32 i = 0; i < length; ++i)
    if (!isalpha(static_cast<u8>(text[i]))) return false;
  return length != 0;
}

bool String::HasHighBit() const {
  for (u32 i = 0; i < length; ++i)
    if (static_cast<u8>(text[i]) >= 128) return true;
  return false;
}

u32 String::Hash(u32 modulus, bool caseSensitive) const {
  u32 hash = 0;
  for (u32 i = 0; i < length; ++i) {
    // Bytes of 128 and above count as negative and have no lower case, whatever the locale.
    const int ch = static_cast<signed char>(text[i]);
    hash = (hash + static_cast<u32>(caseSensitive || ch < 0 ? ch : tolower(ch))) * 2;
  }
  return hash % modulus;
}

// --- Editing -------------------------------------------------------------------------------------

void String::Trim() {
  const u32 leading = SkipBlanks();
  memmove(text, text + leading, length - leading + 1);
  length = LengthOf(text);
  while (length != 0 && IsBlank(text[length - 1])) text[--length] = 0;
}

// Deletes the character at `pos`, and steps over it when an overriding Delete kept it.
void String::DeleteThroughSlot(u32& pos) {
  const u32 before = length;
  Delete(static_cast<int>(pos), 1);
  if (length >= before) ++pos;
}

void String::CollapseBlanks() {
  for (u32 i = 1; i < length;)
    if (IsBlank(text[i]) && IsBlank(text[i - 1]))
      DeleteThroughSlot(i);
    else
      ++i;
}

void String::RemoveControlChars() {
  for (u32 i = 0; i < length;)
    if (static_cast<signed char>(text[i]) < 32)
      DeleteThroughSlot(i);
    else
      ++i;
}

bool String::ReplaceFirstWithChar(const char* needle, char ch, u32 fromPos) {
  if (fromPos >= length || !needle || !*needle) return false;
  const char* found = strstr(text + fromPos, needle);
  if (!found) return false;
  ReplaceAt(static_cast<u32>(found - text), LengthOf(needle), &ch, 1);
  return true;
}

bool String::Substitute(const char* oldText, const char* newText) {
  if (!oldText || !newText || length == 0 || strcmp(oldText, newText) == 0) return false;
  const Argument from(*this, oldText, TextLength(oldText));
  const Argument to(*this, newText, TextLength(newText));
  if (!from.bytes || !to.bytes || !Reserve(AddSizes(length, to.size))) return false;
  const char* found = strstr(text, from.bytes);
  if (found)
    ReplaceAt(static_cast<u32>(found - text), from.size, to.bytes, to.size);
  else
    length = LengthOf(text);
  return found != nullptr;
}

u32 String::ReplaceAll(const char* needle, const char* replacement) {
  if (length == 0 || !needle || !replacement || !*needle) return 0;
  const Argument from(*this, needle, TextLength(needle));
  const Argument to(*this, replacement, TextLength(replacement));
  if (!from.bytes || !to.bytes) return 0;

  // Counted first, so that the block holds the result before anything is changed.
  u32 occurrences = 0;
  for (const char* s = text; (s = strstr(s, from.bytes)) != nullptr; s += from.size) ++occurrences;
  const u32 start = length;
  const u32 result = AddSizes(start - occurrences * from.size, MultiplySizes(occurrences, to.size));
  const u32 usual = AddSizes(to.size, MultiplySizes(2, start));
  if (!Reserve(result > usual ? result : usual)) return 0;

  // The text fits already; this keeps the grow step in line with the work done.
  for (u32 i = 0; i < occurrences; ++i) Reserve(AddSizes(start, to.size));
  ReplaceEach(occurrences, from, to, result);
  length = LengthOf(text);
  return occurrences;
}

// Works in one pass. A text that becomes longer is first moved to the end of the space that the
// result takes, so that reading stays ahead of writing.
void String::ReplaceEach(u32 occurrences, const Argument& from, const Argument& to, u32 result) {
  const char* const end = text + (result > length ? result : length);
  const char* source =
      static_cast<const char*>(memmove(text + (end - text) - length, text, length + 1));
  char* target = text;
  for (u32 i = 0; i < occurrences; ++i) {
    const char* const found = strstr(source, from.bytes);
    const u32 kept = static_cast<u32>(found - source);
    memmove(target, source, kept);
    memcpy(target + kept, to.bytes, to.size);
    source = found + from.size;
    target += kept + to.size;
  }
  memmove(target, source, static_cast<u32>(end - source) + 1);
}

void String::AddToChars(u8 k) {
  for (u32 i = 0; i < length; ++i) text[i] = static_cast<char>(text[i] + k);
}

void String::SubtractFromChars(u8 k) {
  bool high = false;
  for (u32 i = 0; i < length; ++i) {
    text[i] = static_cast<char>(text[i] - k);
    high |= static_cast<u8>(text[i]) >= 128;
  }
  if (high) REPORT_ASSERT("cString", "Subtraction left a byte of 128 or above");
}

void String::XorChars(u8 k) {
  for (u32 i = 0; i < length; ++i)
    if (static_cast<u8>(text[i]) != k) text[i] = static_cast<char>(text[i] ^ k);
}

void String::FromLatin1ToUtf8(const char* s, int n) {
  const u32 wanted = n >= 0 ? static_cast<u32>(n) : n == -1 ? TextLength(s) : 0;
  const Argument from(*this, s, TextLength(s, wanted));
  if ((s && !from.bytes) || !EmptyReserve(MultiplySizes(AddSizes(wanted, 2), 6))) return;
  length = 0;
  for (u32 i = 0; i < from.size; ++i) {
    const u8 byte = static_cast<u8>(from.bytes[i]);
    if (byte >= 128) text[length++] = static_cast<char>(0xC0 | byte >> 6);
    text[length++] = static_cast<char>(byte < 128 ? byte : 0x80 | (byte & 0x3F));
  }
  text[length] = text[length + 1] = 0;
}
