// SPDX-License-Identifier: MIT
// Text between UTF-8, UTF-16 and the system's ANSI code page.
#pragma once

#include <filesystem>
#include <optional>
#include <string>
#include <string_view>

std::filesystem::path PathFromUtf8(std::string_view text);
std::string ToUtf8(const std::filesystem::path& path);
std::string WideToUtf8(std::wstring_view text);

// The bytes of an engine's text: the low bytes when no unit is above 0xFF (the engine got the macro
// one byte a unit), otherwise UTF-8. Null is the empty text.
std::string BytesOf(const wchar_t* text, std::size_t units);

// A path of the file that the ANSI code page can represent, because the module takes no other: the
// path itself or its short name. Empty when there is none. The file must exist.
std::optional<std::filesystem::path> AnsiNamed(const std::filesystem::path& path);
std::string ToAnsi(const std::filesystem::path& path);

// The module converts a result to UTF-16 by the ANSI code page, and an argument back by dropping
// the high bytes. WideLength is the number of UTF-16 units of a text; LowBytesStay is true for a
// text that survives both conversions.
std::size_t WideLength(const std::string& text);
bool LowBytesStay(const std::string& text);

// The system's message for an error code, without a line end.
std::string SystemMessage(unsigned long code);
