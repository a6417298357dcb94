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

// A text of a script engine: of one byte a character, as the macro was given to it, or else UTF-16. Null
// is an empty one.
std::string BytesOf(const wchar_t* text, std::size_t units);

// The file by a path that the ANSI code page can hold, as the module takes it: the path itself or,
// when it has other characters, the short name. Empty when there is none. The file must exist.
std::optional<std::filesystem::path> AnsiNamed(const std::filesystem::path& path);
std::string ToAnsi(const std::filesystem::path& path);

// The module widens a text for a script by the system's ANSI code page: to how many UTF-16 units, and
// whether their low bytes, which it takes when the script hands the text back, are the same text.
std::size_t WideLength(const std::string& text);
bool LowBytesStay(const std::string& text);

// The system's text for an error code, without its line end.
std::string SystemMessage(unsigned long code);
