// SPDX-License-Identifier: MIT
// Where two texts differ, line by line, for people.
//
// A line of a text ends with its LF. Whatever would look the same or not show at all is written in angle
// brackets: in every line control characters and bytes that are not UTF-8 (<U+001B>, <0xFF>), in lines
// that differ also CR, tabs, blanks at the end, and characters without a shape of their own (<CR>,
// <TAB>, <SPACE>, <U+00A0>). A last line without LF is followed by a line that says so.
//
// Errors: none. Threading: any thread.
#pragma once

#include <string>
#include <string_view>
#include <vector>

struct DiffLine {
  enum class Kind { kPlace, kSame, kMissing, kExtra, kRemark };

  Kind kind;
  std::string text;  // with the mark of its kind, without line end
};

// A unified diff with three lines around each change; empty for equal texts. The names are for its first
// two lines.
std::vector<DiffLine> CompareTexts(const std::string& expectedName, std::string_view expected,
                                   const std::string& madeName, std::string_view made);
