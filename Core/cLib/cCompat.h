// SPDX-License-Identifier: MIT
// What differs between C libraries: a few names, and <time.h>, which is to be included through
// here.
#pragma once

#include <string.h>

#include "cLib/cTypes.h"

#if defined(_WIN32)
#include <fcntl.h>
#include <io.h>
#else
#include <strings.h>
#include <unistd.h>
#endif

// mingw-w64's <time.h> marks four variables with a macro that its headers leave undefined for a
// compiler to which __declspec is a keyword.
#if defined(__MINGW64_VERSION_MAJOR) && !defined(__MINGW_IMPORT)
#define __MINGW_IMPORT extern
#endif
#include <time.h>

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
  if (write(1, bytes, size) < 0) return;  // nobody to tell
#endif
}
