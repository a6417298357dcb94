// SPDX-License-Identifier: MIT
#include "report/TextDiff.h"

#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <dtl/dtl.hpp>
#include <iterator>

#include "document/Characters.h"

namespace {

using Kind = DiffLine::Kind;
using Lines = std::vector<std::string_view>;
using Diff = dtl::Diff<std::string_view, Lines>;

// Invisible besides the control characters: spaces, combining marks, zero-width characters.
constexpr struct {
  char32_t first, last;
} kShapeless[] = {{0xA0, 0xA0},     {0xAD, 0xAD},     {0x0300, 0x036F},  {0x2000, 0x200F},
                  {0x2028, 0x202F}, {0x205F, 0x206F}, {0x3000, 0x3000},  {0xFE00, 0xFE0F},
                  {0xFEFF, 0xFEFF}, {0xFFF9, 0xFFFB}, {0xE0000, 0xE0FFF}};

Lines LinesOf(std::string_view text) {
  Lines lines;
  while (!text.empty()) {
    const std::size_t end = std::min(text.find('\n'), text.size() - 1);
    lines.push_back(text.substr(0, end + 1));
    text.remove_prefix(end + 1);
  }
  return lines;
}

// `character` is valid UTF-8.
char32_t CodePoint(std::string_view character) {
  const auto first = static_cast<unsigned char>(character.front());
  if (character.size() == 1) return first;
  char32_t code = first & (0x7Fu >> character.size());
  for (const char byte : character.substr(1)) code = code << 6 | (byte & 0x3F);
  return code;
}

bool IsControl(char32_t code) { return code < 0x20 || (code >= 0x7F && code < 0xA0); }

bool IsShapeless(char32_t code) {
  return std::any_of(std::begin(kShapeless), std::end(kShapeless), [code](const auto& range) {
    return code >= range.first && code <= range.last;
  });
}

std::string Bracketed(const char* format, char32_t number) {
  char text[16];
  std::snprintf(text, sizeof text, format, static_cast<unsigned>(number));
  return text;
}

std::string Shown(std::string_view character, bool differs) {
  const char32_t code = CodePoint(character);
  if (character.size() == 1 && code >= 0x80) return Bracketed("<0x%02X>", code);
  if (code == '\r') return "<CR>";
  if (code == '\t') return differs ? "<TAB>" : "\t";
  if (IsControl(code) || (differs && IsShapeless(code))) return Bracketed("<U+%04X>", code);
  return std::string(character);
}

// `line` has no LF.
std::string ShownLine(std::string_view line, bool differs) {
  if (!differs && line.ends_with('\r')) line.remove_suffix(1);
  const std::size_t blanks = line.find_last_not_of(" \r") + 1;  // start of the trailing spaces
  std::string shown;
  for (std::size_t at = 0; at < line.size();) {
    const std::string_view character = line.substr(at, CharacterLength(line, at));
    const bool trailing = differs && at >= blanks && character == " ";
    shown += trailing ? "<SPACE>" : Shown(character, differs);
    at += character.size();
  }
  return shown;
}

void AddLine(std::vector<DiffLine>& diff, Kind kind, std::string_view line) {
  const char* mark = kind == Kind::kSame ? " " : kind == Kind::kMissing ? "-" : "+";
  const bool ended = line.ends_with('\n');
  if (ended) line.remove_suffix(1);
  diff.push_back({kind, mark + ShownLine(line, kind != Kind::kSame)});
  if (!ended) diff.push_back({Kind::kRemark, "\\ the text ends without a line end"});
}

template <class Hunk>
std::string PlaceOf(const Hunk& hunk) {
  const auto range = [](long long first, long long count) {
    return std::to_string(first) + "," + std::to_string(count);
  };
  return "@@ -" + range(hunk.a, hunk.b) + " +" + range(hunk.c, hunk.d) + " @@";
}

}  // namespace

std::vector<DiffLine> CompareTexts(const std::string& expectedName, std::string_view expected,
                                   const std::string& madeName, std::string_view made) {
  if (expected == made) return {};
  Diff compared(LinesOf(expected), LinesOf(made));
  compared.compose();
  compared.composeUnifiedHunks();
  std::vector<DiffLine> diff = {{Kind::kPlace, "--- " + expectedName},
                                {Kind::kPlace, "+++ " + madeName}};
  for (const auto& hunk : compared.getUniHunks()) {
    diff.push_back({Kind::kPlace, PlaceOf(hunk)});
    for (const auto* part : {&hunk.common[0], &hunk.change, &hunk.common[1]})
      for (const auto& [line, info] : *part)
        AddLine(diff,
                info.type == dtl::SES_COMMON   ? Kind::kSame
                : info.type == dtl::SES_DELETE ? Kind::kMissing
                                               : Kind::kExtra,
                line);
  }
  return diff;
}
