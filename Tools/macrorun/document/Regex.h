// SPDX-License-Identifier: MIT
// Regular expressions (PCRE2) over texts of bytes.
//
// Patterns are UTF-8 and match characters. `^` and `$` match at every line; `\w` and similar
// classes follow Unicode. Bytes that are not valid UTF-8 match only a plain text of such bytes.
// Offsets are in bytes from 0.
#pragma once

#include <cstddef>
#include <memory>
#include <optional>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

// An invalid pattern, or a match that takes too long. The text gives the reason and the place.
struct RegexError : std::runtime_error {
  using std::runtime_error::runtime_error;
};

class Regex {
 public:
  struct Options {
    bool plain = false;  // the pattern is a literal text
    bool ignoreCase = false;
    bool wholeWord = false;
    bool utf8 = false;  // all texts are valid UTF-8; without it each search checks the text first
  };
  struct Match {
    // Begin and end of the match and of its groups; npos for a group that did not take part.
    std::vector<std::pair<std::size_t, std::size_t>> groups;
    std::size_t From() const { return groups[0].first; }
    std::size_t To() const { return groups[0].second; }
    // Empty for a group that does not exist or did not take part.
    std::string_view Group(std::string_view text, std::size_t number) const;
  };

  Regex(const std::string& pattern, Options options);  // throws RegexError
  ~Regex();
  Regex(Regex&&) noexcept;
  Regex& operator=(Regex&&) = delete;

  // The first match that begins at or after `from`. With `notEmptyHere` an empty match at `from`
  // does not count. Throws RegexError.
  std::optional<Match> Find(std::string_view text, std::size_t from, bool notEmptyHere) const;

  // Expands $1 or \1, ${12}, ${name} and $0 (the whole match), and \n, \t, \\ and $$. Other text is
  // copied.
  std::string Expand(std::string_view replacement, std::string_view text, const Match& match) const;

 private:
  std::optional<std::size_t> GroupNumber(std::string_view nameOrNumber) const;

  struct Code;
  std::unique_ptr<Code> code;
  bool bytes = false;  // the pattern is not UTF-8 and is matched byte by byte
  bool unchecked = false;
};
