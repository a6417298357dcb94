// SPDX-License-Identifier: MIT
#include "iLib/iComText.h"

#include <string.h>
#include <windows.h>

static char narrowBuffer[kNarrowLimit + 1];
static wchar_t wideBuffer[kWideLimit];

const char* NarrowFromWide(const wchar_t* text) {
  memset(narrowBuffer, 0, sizeof narrowBuffer);
  for (u32 i = 0; text && i < kNarrowLimit && text[i]; ++i)
    narrowBuffer[i] = static_cast<char>(text[i] & 0xFF);
  return narrowBuffer;
}

const wchar_t* WideFromNarrow(const char* text) {
  memset(wideBuffer, 0, sizeof wideBuffer);
  if (!text) return wideBuffer;
  // Four bytes a unit are more than any code page needs, so a character that is cut at the end of
  // what is converted lies behind the last unit that is kept.
  wchar_t units[4 * kWideLimit];
  const int bytes = static_cast<int>(strnlen(text, 4 * kWideLimit));
  const int count = MultiByteToWideChar(CP_ACP, 0, text, bytes, units, 4 * kWideLimit);
  u32 kept = static_cast<u32>(count);
  if (kept >= kWideLimit) {
    kept = kWideLimit - 1;
    if (IS_HIGH_SURROGATE(units[kept - 1])) --kept;
  }
  memcpy(wideBuffer, units, kept * sizeof(wchar_t));
  return wideBuffer;
}
