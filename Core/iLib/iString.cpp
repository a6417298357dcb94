// SPDX-License-Identifier: MIT
// The operations of String that ask the system: resources, error messages, case and code pages.
#include <string.h>
#include <wchar.h>
#include <windows.h>

#include "cLib/cReport.h"
#include "cLib/cString.h"
#include "iLib/iCodePage.h"
#include "iLib/iModule.h"

static constexpr int kLongestResource = 1024;
static constexpr DWORD kEnglish = 1033;  // United States

// --- Resources -----------------------------------------------------------------------------------

static int LoadText(u32 resourceId, char* buffer, int size) {
  return LoadStringA(static_cast<HINSTANCE>(ModuleHandle()), resourceId, buffer, size);
}

static void ReportMissing(u32 resourceId) {
  String text;
  text.Format("Unexpected error loading '%d' string resource", static_cast<int>(resourceId));
  Report("cString", __LINE__, text.Text(), kReportTrace);
}

String::String(u32 resourceId, ...) {
  char format[1024];
  if (!Begin(0) || LoadText(resourceId, format, sizeof format) <= 0) return;
  va_list args;
  va_start(args, resourceId);
  FormatV(format, args);
  va_end(args);
}

const char* String::FormatResource(u32 resourceId, ...) {
  char format[1030];
  if (LoadText(resourceId, format, kLongestResource + 1) <= 0) {
    ReportMissing(resourceId);
    Assign("");
    return text;
  }
  va_list args;
  va_start(args, resourceId);
  FormatV(format, args);
  va_end(args);
  return text;
}

bool String::LoadResource(u32 resourceId) {
  if (!EmptyReserve(kLongestResource + 1)) return false;
  const int loaded = LoadText(resourceId, text, kLongestResource + 1);  // terminated
  length = loaded > 0 ? static_cast<u32>(loaded) : 0;
  if (length == 0) ReportMissing(resourceId);
  return length != 0;
}

// --- Error messages ------------------------------------------------------------------------------

bool String::FromLastError() {
  u32 code = 0;
  return FromError(code);
}

bool String::FromError(u32& code) {
  if (code == 0) code = GetLastError();
  if (code == 0) {
    Assign("");
    return false;
  }
  Assign("Unexpected, unknown error message!");
  char* message = nullptr;
  FormatMessageA(FORMAT_MESSAGE_ALLOCATE_BUFFER | FORMAT_MESSAGE_FROM_SYSTEM, nullptr, code,
                 kEnglish, reinterpret_cast<char*>(&message), 0, nullptr);
  Assign(message && *message ? message : "Unexpected error performing the operation request!");
  LocalFree(message);
  return false;
}

// --- Case ----------------------------------------------------------------------------------------

void String::CapitalizeWords() {
  CharLowerA(text);
  bool inside = false;
  for (u32 i = 0; i < length; ++i) {
    const bool alphanumeric = IsCharAlphaNumericA(text[i]);
    if (alphanumeric && !inside) CharUpperBuffA(text + i, 1);
    inside = alphanumeric;
  }
}

// --- Code pages ----------------------------------------------------------------------------------

// The units of a wide argument: all up to its NUL for -1, none for null or another negative number.
static u32 UnitsOf(const wchar_t* w, int n) {
  if (!w || n < -1) return 0;
  return n == -1 ? static_cast<u32>(wcslen(w)) : static_cast<u32>(n);
}

void String::FromWideIn(u32 codePage, const wchar_t* w, u32 units, u32 room) {
  const Argument from(*this, w, MultiplySizes(units, sizeof(wchar_t)));
  if ((w && !from.bytes) || !EmptyReserve(room)) return;
  const wchar_t* wide = reinterpret_cast<const wchar_t*>(from.bytes);
  const int count = static_cast<int>(from.size / sizeof(wchar_t));
  const int written = count ? WideCharToMultiByte(codePage, 0, wide, count, text,
                                                  static_cast<int>(room), nullptr, nullptr)
                            : 0;
  length = static_cast<u32>(written);
  text[length] = text[length + 1] = 0;
}

String::String(const wchar_t* w, u32 codePage) {
  char work[4096];
  if (!Begin(0) || !w) return;
  if (WideCharToMultiByte(codePage, 0, w, -1, work, sizeof work, nullptr, nullptr) > 0)
    Assign(work);
}

void String::FromWide(const wchar_t* w, int n) {
  const u32 units = UnitsOf(w, n);
  const u32 codePage = ActiveCodePage();
  // Deliberate: wide text from the system is narrowed to what its own 8-bit functions take.
  FromWideIn(codePage == kUtf8CodePage ? CP_ACP : codePage, w, units,
             AddSizes(MultiplySizes(units, 6), 1));
}

void String::FromUtf16ToUtf8(const wchar_t* w, int n) {
  const u32 units = UnitsOf(w, n);
  FromWideIn(kUtf8CodePage, w, units, MultiplySizes(AddSizes(units, 2), 6));
}

void String::FromUtf8ToUtf16(const char* s, int n) {
  const u32 size = !s || n < -1 ? 0 : n == -1 ? TextLength(s) : static_cast<u32>(n);
  const Argument from(*this, s, size);
  const u32 claimed = AddSizes(size, 100);
  const u32 room = AddSizes(MultiplySizes(claimed, 2), 2);
  if ((s && !from.bytes) || !EmptyReserve(room)) return;
  wchar_t* wide = reinterpret_cast<wchar_t*>(text);
  const int written =
      from.size ? MultiByteToWideChar(kUtf8CodePage, MB_ERR_INVALID_CHARS, from.bytes,
                                      static_cast<int>(from.size), wide, static_cast<int>(claimed))
                : 0;
  if (written > 0 || from.size == 0) {
    length = static_cast<u32>(written) * sizeof(wchar_t);
    wide[written] = 0;
  } else {
    memset(text, 0, room);
    length = claimed;
  }
}
