// SPDX-License-Identifier: MIT
#include "TextCoding.h"

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

// The byte of a single-byte code page that stands for the unit, or -1. The system's own conversion
// is not its inverse: it also makes bytes of units that merely look alike.
static int ByteOf(const wchar_t (&page)[256], wchar_t unit) {
  if (unit < 128 && page[unit] == unit) return unit;
  for (int byte = 0; byte < 256; ++byte)
    if (page[byte] == unit) return byte;
  return -1;
}

UINT BytesFromAnsi(UINT codePage, const wchar_t* text, UINT units, char* target) {
  CPINFO info;
  if (!GetCPInfo(codePage, &info) || info.MaxCharSize > 1) {
    const int room = static_cast<int>(units * kMostBytesPerUnit);
    if (units == 0) return 0;
    return static_cast<UINT>(WideCharToMultiByte(codePage, 0, text, static_cast<int>(units), target,
                                                 room, nullptr, nullptr));
  }
  wchar_t page[256];
  for (int byte = 0; byte < 256; ++byte) {
    const char narrow = static_cast<char>(byte);
    if (MultiByteToWideChar(codePage, 0, &narrow, 1, &page[byte], 1) != 1) page[byte] = 0xFFFF;
  }
  for (UINT i = 0; i < units; ++i) {
    const int byte = ByteOf(page, text[i]);
    target[i] = byte < 0 ? '?' : static_cast<char>(byte);
  }
  return units;
}
