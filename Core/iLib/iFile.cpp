// SPDX-License-Identifier: MIT
#include "iLib/iFile.h"

#include <objbase.h>
#include <stdlib.h>
#include <string.h>
#include <windows.h>

#include "cLib/cTypes.h"

// The wide text takes two bytes for each byte of the file, and both stay below the address space.
static constexpr DWORD kLargestFile = 0x3FFFFFFF;

static bool ReadWhole(HANDLE file, char* bytes, DWORD size) {
  DWORD done = 0;
  while (done < size) {
    DWORD got = 0;
    if (!ReadFile(file, bytes + done, size - done, &got, nullptr) || got == 0) return false;
    done += got;
  }
  return true;
}

// The file's bytes followed by ten zeros, or null. Free with CoTaskMemFree.
static char* LoadBytes(HANDLE file, DWORD size) {
  char* bytes = static_cast<char*>(CoTaskMemAlloc(size + 10));
  if (!bytes) return nullptr;
  memset(bytes + size, 0, 10);
  if (ReadWhole(file, bytes, size)) return bytes;
  CoTaskMemFree(bytes);
  return nullptr;
}

static wchar_t* Widen(const char* bytes, DWORD size) {
  const u32 wideBytes = size * 2 + 20;
  wchar_t* text = static_cast<wchar_t*>(CoTaskMemAlloc(wideBytes));
  if (!text) return nullptr;
  // A conversion that fails half-way does not report the position: the part before it is kept.
  memset(text, 0, wideBytes);
  mbstowcs(text, bytes, size + 1);
  return text;
}

wchar_t* LoadFileAsWideText(const char* name) {
  if (!name || !*name) return nullptr;
  HANDLE file = CreateFileA(name, GENERIC_READ, FILE_SHARE_READ, nullptr, OPEN_EXISTING,
                            FILE_ATTRIBUTE_NORMAL, nullptr);
  if (file == INVALID_HANDLE_VALUE) return nullptr;
  DWORD sizeHigh = 0;
  const DWORD size = GetFileSize(file, &sizeHigh);
  const bool usable = sizeHigh == 0 && size <= kLargestFile;
  char* bytes = usable ? LoadBytes(file, size) : nullptr;
  wchar_t* text = bytes ? Widen(bytes, size) : nullptr;
  CoTaskMemFree(bytes);
  CloseHandle(file);
  return text;
}
