// SPDX-License-Identifier: MIT
// What differs between C libraries and systems. Include <time.h> through this header only.
#pragma once

#include <string.h>

#include "cLib/cTypes.h"

#if defined(_WIN32)
#include <fcntl.h>
#include <io.h>
#else
#include <pthread.h>
#include <strings.h>
#include <unistd.h>
#endif

// mingw-w64's <time.h> marks four variables with a macro that its headers leave undefined for a
// compiler to which __declspec is a keyword.
#if defined(__MINGW64_VERSION_MAJOR) && !defined(__MINGW_IMPORT)
#define __MINGW_IMPORT extern
#endif
#include <time.h>

// The local time in the form of ctime; null where the C library has none. On Windows 64 bits wide:
// ctime itself ends in 2038.
inline const char* LocalTimeText() {
#if defined(_WIN32)
  const __time64_t now = _time64(nullptr);
  return _ctime64(&now);
#else
  const time_t now = time(nullptr);
  return ctime(&now);
#endif
}

#if defined(_WIN32)
// As <windows.h> declares it, which the portable base does not include.
extern "C" __declspec(dllimport) unsigned long __stdcall GetCurrentThreadId(void);
#endif

// A number of the calling thread that no other live thread has.
inline u32 CurrentThread() {
#if defined(_WIN32)
  return GetCurrentThreadId();
#else
  return static_cast<u32>(pthread_self());
#endif
}

// A to Z as small letters, whatever the locale.
inline char FoldAscii(char ch) {
  return ch >= 'A' && ch <= 'Z' ? static_cast<char>(ch + ('a' - 'A')) : ch;
}

// The C runtime's orders that ignore case.
inline int CompareIgnoringCase(const char* a, const char* b) {
#if defined(_WIN32)
  return _stricmp(a, b);
#else
  return strcasecmp(a, b);
#endif
}

inline int CompareIgnoringCase(const char* a, const char* b, u32 size) {
#if defined(_WIN32)
  return _strnicmp(a, b, size);
#else
  return strncasecmp(a, b, size);
#endif
}

// Writes bytes to standard output (descriptor 1) as they are.
inline void WriteOutputBytes(const char* bytes, u32 size) {
#if defined(_WIN32)
  const int mode = _setmode(1, _O_BINARY);
  (void)_write(1, bytes, size);
  if (mode != -1) _setmode(1, mode);
#else
  if (write(1, bytes, size) < 0) return;  // no one to report it to
#endif
}
