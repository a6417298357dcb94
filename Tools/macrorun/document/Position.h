// SPDX-License-Identifier: MIT
// Positions in a document, and the data that it exchanges.
#pragma once

#include <compare>
#include <cstddef>
#include <string>
#include <vector>

struct Position {
  std::size_t line = 1;
  std::size_t offset = 0;  // in bytes from 0
  auto operator<=>(const Position&) const = default;
};

struct Range {
  Position from, to;
  bool operator==(const Range&) const = default;
};

struct Replacement {
  Range range;
  std::string text;
};

// A document's text in one piece.
struct FlatText {
  std::string text;                 // with a line feed for each line end
  std::vector<std::size_t> starts;  // of the lines, and of the one that would follow
  bool utf8;                        // the text is certainly valid UTF-8
};
