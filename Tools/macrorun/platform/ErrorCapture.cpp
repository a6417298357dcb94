// SPDX-License-Identifier: MIT
#include "platform/ErrorCapture.h"

#include <fcntl.h>
#include <io.h>
#include <windows.h>

#include <cstdio>

ErrorCapture::ErrorCapture() : file(-1), saved(-1) {
  wchar_t folder[MAX_PATH], name[MAX_PATH];
  if (!GetTempPathW(MAX_PATH, folder) || !GetTempFileNameW(folder, L"mac", 0, name)) return;
  file = _wopen(name, _O_RDWR | _O_BINARY | _O_TEMPORARY);
  if (file < 0) return;
  saved = _dup(_fileno(stderr));
  _dup2(file, _fileno(stderr));
}

std::string ErrorCapture::Take() {
  std::string text;
  if (file < 0) return text;
  _dup2(saved, _fileno(stderr));
  _close(saved);
  _lseek(file, 0, SEEK_SET);
  char block[4096];
  for (int count; (count = _read(file, block, sizeof block)) > 0;)
    text.append(block, static_cast<std::size_t>(count));
  _close(file);  // deletes it
  file = -1;
  return text;
}
