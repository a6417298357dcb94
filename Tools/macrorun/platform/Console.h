// SPDX-License-Identifier: MIT
// Input and output on a terminal or a redirected stream, with colour on standard error.
//
// Texts are UTF-8. Other bytes are written unchanged; a terminal shows a replacement character.
// Colour is used on a terminal only, and not when the environment variable NO_COLOR is set and not
// empty.
// Errors: a failed write to standard error is ignored.
// Threading: any thread; texts of two threads can mix line by line.
#pragma once

#include <cstdio>
#include <functional>
#include <optional>
#include <string>
#include <string_view>

enum class Colour { kPlain, kError, kHighlight, kFaint };

// Switches standard error to binary, so that the C library does not change line ends.
void PrepareStandardError();

bool IsTerminal(std::FILE* stream);

// Whether standard input is a pipe or a file with unread data. True for a pipe that cannot be
// examined, such as a Unix pipe under Wine.
bool InputIsLeft();

// To standard output, byte for byte unless it is a terminal. UsageError when that fails.
void WriteStandardOutput(std::string_view bytes);

void WriteError(std::string_view text, Colour colour = Colour::kPlain);

// Reads lines from the terminal, each with a line feed, until one starts with Ctrl+Z or Ctrl+D.
std::string ReadTerminalText();

// Reads a line from the terminal, without its line end. Returns nothing at the end of the input, or
// once `isGivenUp` returns true. In the second case the terminal's next line is lost, so the
// program must end.
std::optional<std::string> ReadTerminalLine(const std::function<bool()>& isGivenUp);
