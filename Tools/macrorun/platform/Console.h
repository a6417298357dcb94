// SPDX-License-Identifier: MIT
// The streams that a person may be looking at: whether they are a terminal, and text for them, with colour
// on standard error.
//
// Texts are UTF-8; what is not passes as it is, except to a terminal, which shows a replacement
// character. Colour is used on a terminal only, and never when the environment variable NO_COLOR is
// set and not empty.
// Errors: standard error that cannot be written is passed over; there is nobody to tell.
// Threading: any thread; texts of two threads may mix line by line.
#pragma once

#include <cstdio>
#include <functional>
#include <optional>
#include <string>
#include <string_view>

enum class Colour { kPlain, kError, kHighlight, kFaint };

// Standard error as it is, without the C library's line ends.
void PrepareStandardError();

bool IsTerminal(std::FILE* stream);

// Whether standard input is a pipe or a file of which there is something left to read, at this moment.
// Also a pipe that does not tell: Wine looks into none of Unix's.
bool InputIsLeft();

// To standard output, byte for byte unless it is a terminal. UsageError when that fails.
void WriteStandardOutput(std::string_view bytes);

void WriteError(std::string_view text, Colour colour = Colour::kPlain);

// The lines that the user types, each with a line feed, up to Ctrl+Z (or Ctrl+D) at the start of one.
std::string ReadTerminalText();

// A line that the user types, without its end; nothing at the end of the input, and when `isGivenUp`, which
// is asked again and again, says so. Then the terminal's next line is lost: the program is to end.
std::optional<std::string> ReadTerminalLine(const std::function<bool()>& isGivenUp);
