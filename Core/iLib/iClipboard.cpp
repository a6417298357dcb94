// SPDX-License-Identifier: MIT
#include "iLib/iClipboard.h"

#include <string.h>
#include <windows.h>

bool GetClipboardText(String& out) {
  out.Assign("");
  if (!IsClipboardFormatAvailable(CF_TEXT) || !OpenClipboard(nullptr)) return false;
  const HANDLE data = GetClipboardData(CF_TEXT);
  if (const char* text = data ? static_cast<const char*>(GlobalLock(data)) : nullptr) {
    // Another program's block need not be terminated.
    const size_t size = strnlen(text, GlobalSize(data));
    out.Append(text, static_cast<int>(size));
    GlobalUnlock(data);
  }
  CloseClipboard();
  return true;
}
