// SPDX-License-Identifier: MIT
#include "iLib/iComText.h"

#include <string.h>
#include <windows.h>

static NarrowText narrowBuffer;
static wchar_t wideBuffer[kWideLimit];

const char* NarrowFromWide(const wchar_t* text, NarrowText& out) {
  u32 size = 0;
  for (; text && size < kNarrowLimit && (text[size] & 0xFF); ++size)
    out[size] = static_cast<char>(text[size] & 0xFF);
  out[size] = 0;
  return out;
}

const char* NarrowFromWide(const wchar_t* text) { return NarrowFromWide(text, narrowBuffer); }

const wchar_t* WideFromNarrow(const char* text) {
  if (!text) text = "";
  // A byte makes one unit at most, and no code page needs four bytes a unit. So a character that is
  // cut at the end of the input comes after the last unit that is kept.
  wchar_t units[4 * kWideLimit];
  const int bytes = static_cast<int>(strnlen(text, 4 * kWideLimit));
  const int count = MultiByteToWideChar(CP_ACP, 0, text, bytes, units, bytes);
  u32 kept = static_cast<u32>(count);
  if (kept >= kWideLimit) {
    kept = kWideLimit - 1;
    if (IS_HIGH_SURROGATE(units[kept - 1])) --kept;
  }
  memcpy(wideBuffer, units, kept * sizeof(wchar_t));
  wideBuffer[kept] = 0;
  return wideBuffer;
}
