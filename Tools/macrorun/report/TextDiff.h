// SPDX-License-Identifier: MIT
// A unified diff of two texts in which differences are visible.
//
// A line ends with its LF. Angle brackets show control characters and bytes that are not UTF-8
// (<U+001B>, <0xFF>). In lines that differ they also show CR, tabs, trailing spaces and invisible
// characters (<CR>, <TAB>, <SPACE>, <U+00A0>). A remark follows a last line without LF.
//
// Errors: none. Threading: any thread.
#pragma once

#include <string>
#include <string_view>
#include <vector>

struct DiffLine {
  enum class Kind { kPlace, kSame, kMissing, kExtra, kRemark };

  Kind kind;
  std::string text;  // starts with the sign of its kind; without line end
};

// With three lines of context; empty for equal texts. The first two lines contain the names.
std::vector<DiffLine> CompareTexts(const std::string& expectedName, std::string_view expected,
                                   const std::string& madeName, std::string_view made);
