// SPDX-License-Identifier: MIT
#include "iLib/iCodePage.h"

#include <stdlib.h>
#include <windows.h>

static u32 activeCodePage = kUtf8CodePage;

u32 ActiveCodePage() { return activeCodePage; }

void SetActiveCodePageFromKeyboard() {
  const WORD language = LOWORD(reinterpret_cast<DWORD_PTR>(GetKeyboardLayout(0)));
  char digits[16] = "";
  GetLocaleInfoA(MAKELCID(language, SORT_DEFAULT), LOCALE_IDEFAULTANSICODEPAGE, digits,
                 sizeof digits);
  // A language that is only written in Unicode has the number 0.
  const u32 codePage = static_cast<u32>(atoi(digits));
  activeCodePage = codePage ? codePage : kUtf8CodePage;
}

// Appends up to `zeros` zero units to `count` units, as far as `room` allows.
template <class Unit>
static void Terminate(Unit* out, int room, int count, int zeros) {
  for (int i = 0; i < zeros && count < room; ++i) out[count++] = 0;
}

int MultiByteToUtf16(const char* s, int n, wchar_t* out, int room, u32 codePage) {
  const int count = MultiByteToWideChar(codePage, 0, s, n, out, room);
  if (count > 0 && out) Terminate(out, room, count, 4);
  return count;
}

int Utf16ToMultiByte(const wchar_t* w, int n, char* out, int room, u32 codePage) {
  const int count = WideCharToMultiByte(codePage, 0, w, n, out, room, nullptr, nullptr);
  if (out) Terminate(out, room, count, 2);
  return count;
}
