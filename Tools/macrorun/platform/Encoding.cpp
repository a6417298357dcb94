// SPDX-License-Identifier: MIT
#include "platform/Encoding.h"

#include <windows.h>

#include <algorithm>

namespace {

std::wstring Widen(std::string_view text, UINT codePage) {
  const int length = static_cast<int>(text.size());
  const int needed = MultiByteToWideChar(codePage, 0, text.data(), length, nullptr, 0);
  std::wstring wide(static_cast<std::size_t>(needed), L'\0');
  MultiByteToWideChar(codePage, 0, text.data(), length, wide.data(), needed);
  return wide;
}

std::string Narrow(std::wstring_view text, UINT codePage) {
  const int length = static_cast<int>(text.size());
  // UTF-8 represents every character, and the flag is invalid for it.
  const DWORD flags = codePage == CP_UTF8 ? 0 : WC_NO_BEST_FIT_CHARS;
  const int needed =
      WideCharToMultiByte(codePage, flags, text.data(), length, nullptr, 0, nullptr, nullptr);
  std::string narrow(static_cast<std::size_t>(needed), '\0');
  WideCharToMultiByte(codePage, flags, text.data(), length, narrow.data(), needed, nullptr,
                      nullptr);
  return narrow;
}

}  // namespace

std::filesystem::path PathFromUtf8(std::string_view text) { return Widen(text, CP_UTF8); }

std::string ToUtf8(const std::filesystem::path& path) { return WideToUtf8(path.wstring()); }

std::string WideToUtf8(std::wstring_view text) { return Narrow(text, CP_UTF8); }

std::string BytesOf(const wchar_t* text, std::size_t units) {
  const std::wstring_view wide(text ? text : L"", units);
  std::string bytes;
  for (const wchar_t unit : wide) {
    if (unit > 0xFF) return WideToUtf8(wide);
    bytes += static_cast<char>(unit);
  }
  return bytes;
}

std::optional<std::filesystem::path> AnsiNamed(const std::filesystem::path& path) {
  if (Widen(ToAnsi(path), CP_ACP) == path.wstring()) return path;
  wchar_t shortName[MAX_PATH];
  const DWORD length = GetShortPathNameW(path.c_str(), shortName, MAX_PATH);
  if (length == 0 || length >= MAX_PATH) return {};
  if (Widen(ToAnsi(shortName), CP_ACP) != shortName) return {};
  return shortName;
}

std::string ToAnsi(const std::filesystem::path& path) { return Narrow(path.wstring(), GetACP()); }

std::size_t WideLength(const std::string& text) { return Widen(text, CP_ACP).size(); }

bool LowBytesStay(const std::string& text) {
  const std::wstring wide = Widen(text, CP_ACP);
  return std::equal(wide.begin(), wide.end(), text.begin(), text.end(),
                    [](wchar_t unit, char byte) { return static_cast<char>(unit) == byte; });
}

std::string SystemMessage(unsigned long code) {
  wchar_t text[512];
  const DWORD length = FormatMessageW(FORMAT_MESSAGE_FROM_SYSTEM | FORMAT_MESSAGE_IGNORE_INSERTS,
                                      nullptr, code, 0, text, 512, nullptr);
  std::string message = WideToUtf8(std::wstring_view(text, length));
  message.erase(message.find_last_not_of("\r\n ") + 1);
  return message.empty() ? "error " + std::to_string(code) : message;
}
