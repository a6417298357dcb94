// SPDX-License-Identifier: MIT
#include "document/Characters.h"

#include <windows.h>

#include <algorithm>

namespace {

struct Character {
  char32_t code;       // 0 for an invalid byte
  std::size_t length;  // in bytes
  bool valid;
};

unsigned char ByteAt(std::string_view text, std::size_t offset) {
  return static_cast<unsigned char>(text[offset]);
}

Character Decode(std::string_view text, std::size_t offset) {
  constexpr Character kInvalid = {0, 1, false};
  const unsigned char first = ByteAt(text, offset);
  if (first < 0x80) return {first, 1, true};
  if (first < 0xC2 || first > 0xF4) return kInvalid;
  const std::size_t length = first < 0xE0 ? 2 : first < 0xF0 ? 3 : 4;
  if (text.size() - offset < length) return kInvalid;
  char32_t code = first & (0xFFu >> (length + 1));
  for (std::size_t i = 1; i < length; ++i) {
    const unsigned char byte = ByteAt(text, offset + i);
    if ((byte & 0xC0) != 0x80) return kInvalid;
    code = code << 6 | (byte & 0x3Fu);
  }
  constexpr char32_t kLeast[] = {0, 0, 0x80, 0x800, 0x10000};
  const bool surrogate = code >= 0xD800 && code < 0xE000;
  if (code < kLeast[length] || surrogate || code > 0x10FFFF) return kInvalid;
  return {code, length, true};
}

bool IsWordCharacter(char32_t code) {
  if (code < 0x80) return code == '_' || IsCharAlphaNumericW(static_cast<wchar_t>(code));
  // The system classifies 16-bit units. Above them, only the ideographic planes count as letters.
  if (code > 0xFFFF) return code >= 0x20000 && code < 0x40000;
  const wchar_t unit = static_cast<wchar_t>(code);
  WORD type = 0, marks = 0;
  GetStringTypeW(CT_CTYPE1, &unit, 1, &type);
  GetStringTypeW(CT_CTYPE3, &unit, 1, &marks);
  return (type & (C1_ALPHA | C1_DIGIT)) != 0 || (marks & C3_NONSPACING) != 0;
}

void Append(std::string& text, char32_t code) {
  if (code < 0x80) {
    text += static_cast<char>(code);
  } else if (code < 0x800) {
    text += {static_cast<char>(0xC0 | code >> 6), static_cast<char>(0x80 | (code & 0x3F))};
  } else {
    text += {static_cast<char>(0xE0 | code >> 12), static_cast<char>(0x80 | (code >> 6 & 0x3F)),
             static_cast<char>(0x80 | (code & 0x3F))};
  }
}

char32_t Mapped(char32_t code, bool upper) {
  const wchar_t unit = static_cast<wchar_t>(code);
  wchar_t mapped = unit;
  const DWORD flags = LCMAP_LINGUISTIC_CASING | (upper ? LCMAP_UPPERCASE : LCMAP_LOWERCASE);
  LCMapStringW(LOCALE_INVARIANT, flags, &unit, 1, &mapped, 1);
  return mapped;
}

}  // namespace

std::size_t CharacterLength(std::string_view text, std::size_t offset) {
  return Decode(text, offset).length;
}

std::size_t PreviousCharacter(std::string_view text, std::size_t offset) {
  const std::size_t farthest = std::min<std::size_t>(4, offset);
  for (std::size_t back = 2; back <= farthest; ++back)
    if (Decode(text.substr(0, offset), offset - back).length == back) return offset - back;
  return offset - 1;
}

bool IsCharacterStart(std::string_view text, std::size_t offset) {
  const std::size_t farthest = std::min<std::size_t>(3, offset);
  for (std::size_t back = 1; back <= farthest; ++back)
    if (Decode(text, offset - back).length > back) return false;
  return true;
}

std::size_t CharacterCount(std::string_view text) {
  std::size_t count = 0;
  for (std::size_t i = 0; i < text.size(); i += CharacterLength(text, i)) ++count;
  return count;
}

std::size_t OffsetOfCharacter(std::string_view text, std::size_t count) {
  std::size_t offset = 0;
  while (count-- > 0 && offset < text.size()) offset += CharacterLength(text, offset);
  return offset;
}

bool IsValidUtf8(std::string_view text) {
  for (std::size_t i = 0; i < text.size();) {
    if (ByteAt(text, i) < 0x80) {  // by far the most
      ++i;
      continue;
    }
    const Character character = Decode(text, i);
    if (!character.valid) return false;
    i += character.length;
  }
  return true;
}

bool IsWordAt(std::string_view text, std::size_t offset) {
  const Character character = Decode(text, offset);
  return character.valid && IsWordCharacter(character.code);
}

std::string WithCase(std::string_view text, LetterCase letterCase) {
  std::string result;
  bool inWord = false;
  for (std::size_t i = 0; i < text.size();) {
    const Character character = Decode(text, i);
    const bool upper =
        letterCase == LetterCase::kUpper || (letterCase == LetterCase::kTitle && !inWord);
    if (!character.valid || character.code > 0xFFFF)
      result += text.substr(i, character.length);
    else
      Append(result, Mapped(character.code, upper));
    inWord = character.valid && IsWordCharacter(character.code);
    i += character.length;
  }
  return result;
}
