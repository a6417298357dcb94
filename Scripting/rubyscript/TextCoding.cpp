// SPDX-License-Identifier: MIT
#include "TextCoding.h"

#include <stdlib.h>
#include <wchar.h>

BSTR TextToHost(const char* text, UINT bytes, TextForm form) {
  if (form == TextForm::kBytes) {
    const BSTR wide = SysAllocStringLen(nullptr, bytes);
    for (UINT i = 0; wide && i < bytes; ++i) wide[i] = static_cast<unsigned char>(text[i]);
    return wide;
  }
  const int length = static_cast<int>(bytes);
  const int units = length ? MultiByteToWideChar(CP_UTF8, 0, text, length, nullptr, 0) : 0;
  const BSTR wide = SysAllocStringLen(nullptr, static_cast<UINT>(units));
  if (wide && units) MultiByteToWideChar(CP_UTF8, 0, text, length, wide, units);
  return wide;
}

UINT TextFromHost(const wchar_t* text, UINT units, TextForm form, TextOrigin origin, char* target) {
  if (form == TextForm::kUtf16) {
    const int room = static_cast<int>(units * kMostBytesPerUnit);
    if (units == 0) return 0;
    return static_cast<UINT>(WideCharToMultiByte(CP_UTF8, 0, text, static_cast<int>(units), target,
                                                 room, nullptr, nullptr));
  }
  if (origin == TextOrigin::kResult) return BytesFromAnsi(GetACP(), text, units, target);
  for (UINT i = 0; i < units; ++i) target[i] = static_cast<char>(text[i]);
  return units;
}

// What a single-byte code page makes of each byte. Asked of the system once.
struct CodePage {
  UINT number = 0;
  wchar_t units[256];
};

static const CodePage& PageOf(UINT number) {
  static CodePage page;
  if (page.number == number) return page;
  for (int byte = 0; byte < 256; ++byte) {
    const char narrow = static_cast<char>(byte);
    if (MultiByteToWideChar(number, 0, &narrow, 1, &page.units[byte], 1) != 1)
      page.units[byte] = 0xFFFF;
  }
  page.number = number;
  return page;
}

// The system's own conversion is not the inverse of the other: it also makes bytes of units that
// merely look alike.
static char ByteOf(const CodePage& page, wchar_t unit) {
  if (unit < 128 && page.units[unit] == unit) return static_cast<char>(unit);
  for (int byte = 255; byte >= 0; --byte)
    if (page.units[byte] == unit) return static_cast<char>(byte);
  return '?';
}

UINT BytesFromAnsi(UINT codePage, const wchar_t* text, UINT units, char* target) {
  CPINFO info;
  if (!GetCPInfo(codePage, &info) || info.MaxCharSize > 1) {
    const int room = static_cast<int>(units * kMostBytesPerUnit);
    if (units == 0) return 0;
    return static_cast<UINT>(WideCharToMultiByte(codePage, 0, text, static_cast<int>(units), target,
                                                 room, nullptr, nullptr));
  }
  const CodePage& page = PageOf(codePage);
  for (UINT i = 0; i < units; ++i) target[i] = ByteOf(page, text[i]);
  return units;
}

// A comment in one of the first two lines, by Ruby's rules.
static bool NamesItsEncoding(const wchar_t* text) {
  for (int line = 0; line < 2 && *text; ++line) {
    const size_t length = wcscspn(text, L"\n");
    const wchar_t* const word = wcsstr(text, L"coding");
    if (text[wcsspn(text, L" \t")] == '#' && word && word < text + length &&
        (word[6] == ':' || word[6] == '='))
      return true;
    text += length + (text[length] == '\n');
  }
  return false;
}

bool HoldsBytes(const wchar_t* text, UINT units) {
  for (UINT i = 0; i < units; ++i)
    if (text[i] > 0xFF) return false;
  return true;
}

bool IsByteText(const wchar_t* text) {
  const UINT units = static_cast<UINT>(wcslen(text));
  if (!HoldsBytes(text, units)) return false;
  if (units == 0 || NamesItsEncoding(text)) return true;
  char* const bytes = static_cast<char*>(malloc(units));
  if (!bytes) return false;
  for (UINT i = 0; i < units; ++i) bytes[i] = static_cast<char>(text[i]);
  const int length = static_cast<int>(units);
  const bool valid =
      MultiByteToWideChar(CP_UTF8, MB_ERR_INVALID_CHARS, bytes, length, nullptr, 0) > 0;
  free(bytes);
  return valid;
}
