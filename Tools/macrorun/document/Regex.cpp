// SPDX-License-Identifier: MIT
#include "document/Regex.h"

#define PCRE2_CODE_UNIT_WIDTH 8
#define PCRE2_STATIC
#include <pcre2.h>

#include <new>

#include "document/Characters.h"

namespace {

std::string ErrorText(int error) {
  PCRE2_UCHAR text[256];
  pcre2_get_error_message(error, text, sizeof text);
  return reinterpret_cast<const char*>(text);
}

PCRE2_SPTR Units(std::string_view text) { return reinterpret_cast<PCRE2_SPTR>(text.data()); }

bool IsDigit(char character) { return character >= '0' && character <= '9'; }

// A pattern that matches the text literally.
std::string Quoted(const std::string& text) {
  std::string pattern;
  for (const char character : text) {
    const char lower = static_cast<char>(character | 0x20);
    const bool letter = lower >= 'a' && lower <= 'z';
    const bool high = static_cast<unsigned char>(character) >= 0x80;
    if (!letter && !high && !IsDigit(character)) pattern += '\\';
    pattern += character;
  }
  return pattern;
}

}  // namespace

struct Regex::Code {
  pcre2_code* pattern = nullptr;
  pcre2_match_data* match = nullptr;
  ~Code() {
    pcre2_match_data_free(match);
    pcre2_code_free(pattern);
  }
};

Regex::~Regex() = default;
Regex::Regex(Regex&&) noexcept = default;

Regex::Regex(const std::string& given, Options options) : code(std::make_unique<Code>()) {
  std::string pattern = options.plain ? Quoted(given) : given;
  if (options.wholeWord) pattern = "(?<!\\w)(?:" + pattern + ")(?!\\w)";
  unchecked = options.utf8;
  bytes = options.plain && !IsValidUtf8(given);
  std::uint32_t flags = PCRE2_MULTILINE | PCRE2_NEVER_BACKSLASH_C;
  if (!bytes) flags |= PCRE2_UTF | PCRE2_UCP;
  // The flag makes every match check the rest of the text.
  if (!bytes && !unchecked) flags |= PCRE2_MATCH_INVALID_UTF;
  if (options.ignoreCase) flags |= PCRE2_CASELESS;
  std::unique_ptr<pcre2_compile_context, void (*)(pcre2_compile_context*)> context(
      pcre2_compile_context_create(nullptr), pcre2_compile_context_free);
  if (!context) throw std::bad_alloc();
  pcre2_set_newline(context.get(), PCRE2_NEWLINE_LF);
  int error = 0;
  PCRE2_SIZE place = 0;
  code->pattern =
      pcre2_compile(Units(pattern), pattern.size(), flags, &error, &place, context.get());
  if (!code->pattern)
    throw RegexError(ErrorText(error) + " at character " +
                     std::to_string(CharacterCount(pattern.substr(0, place)) + 1));
  code->match = pcre2_match_data_create_from_pattern(code->pattern, nullptr);
  if (!code->match) throw std::bad_alloc();
}

std::string_view Regex::Match::Group(std::string_view text, std::size_t number) const {
  if (number >= groups.size() || groups[number].first == text.npos) return {};
  return text.substr(groups[number].first, groups[number].second - groups[number].first);
}

std::optional<Regex::Match> Regex::Find(std::string_view text, std::size_t from,
                                        bool notEmptyHere) const {
  std::uint32_t flags = notEmptyHere ? PCRE2_NOTEMPTY_ATSTART : 0;
  if (unchecked) flags |= PCRE2_NO_UTF_CHECK;
  for (;;) {
    const int count =
        pcre2_match(code->pattern, Units(text), text.size(), from, flags, code->match, nullptr);
    if (count == PCRE2_ERROR_NOMATCH) return {};
    if (count < 0) throw RegexError(ErrorText(count));
    const PCRE2_SIZE* ends = pcre2_get_ovector_pointer(code->match);
    const bool whole = IsCharacterStart(text, ends[0]) && IsCharacterStart(text, ends[1]);
    if (bytes && !whole) {  // inside a character
      from = ends[0] + 1;
      continue;
    }
    Match match;
    for (std::uint32_t i = 0; i < pcre2_get_ovector_count(code->match); ++i) {
      const bool set = i < static_cast<std::uint32_t>(count) && ends[2 * i] != PCRE2_UNSET;
      match.groups.emplace_back(set ? ends[2 * i] : text.npos, set ? ends[2 * i + 1] : text.npos);
    }
    return match;
  }
}

std::optional<std::size_t> Regex::GroupNumber(std::string_view name) const {
  if (!name.empty() && name.size() < 4 && name.find_first_not_of("0123456789") == name.npos)
    return std::stoul(std::string(name));
  const int number = pcre2_substring_number_from_name(code->pattern, Units(std::string(name)));
  if (number < 0) return {};
  return static_cast<std::size_t>(number);
}

std::string Regex::Expand(std::string_view replacement, std::string_view text,
                          const Match& match) const {
  std::string result;
  for (std::size_t i = 0; i < replacement.size(); ++i) {
    const char sign = replacement[i];
    const char next = i + 1 < replacement.size() ? replacement[i + 1] : '\0';
    const std::size_t close = replacement.find('}', i);
    std::optional<std::size_t> group;
    if ((sign == '$' || sign == '\\') && IsDigit(next)) {
      group = static_cast<std::size_t>(next - '0');
    } else if (sign == '$' && next == '{' && close != text.npos) {
      group = GroupNumber(replacement.substr(i + 2, close - i - 2));
    }
    if (group) {
      result += match.Group(text, *group);
      i = next == '{' ? close : i + 1;
    } else if ((sign == '$' || sign == '\\') && next == sign) {
      result += replacement[++i];
    } else if (sign == '\\' && (next == 'n' || next == 't')) {
      result += next == 'n' ? '\n' : '\t';
      ++i;
    } else {
      result += sign;
    }
  }
  return result;
}
