// SPDX-License-Identifier: MIT
// Characters in texts of bytes that are UTF-8 by convention.
//
// A character is a Unicode code point. A byte outside of a valid UTF-8 sequence counts as one
// character; overlong forms, surrogates and values above U+10FFFF are not valid. Offsets are in
// bytes from 0.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

// Bytes of the character at `offset`, which must be inside the text and at a character's start.
std::size_t CharacterLength(std::string_view text, std::size_t offset);
// The start of the character before `offset`, which must not be 0 and be at a character's start.
std::size_t PreviousCharacter(std::string_view text, std::size_t offset);
// Whether a character starts at `offset`, or the text ends there.
bool IsCharacterStart(std::string_view text, std::size_t offset);

std::size_t CharacterCount(std::string_view text);
// The offset after the first `count` characters; the text's length when it has fewer.
std::size_t OffsetOfCharacter(std::string_view text, std::size_t count);
bool IsValidUtf8(std::string_view text);

// Words consist of letters, digits, combining marks and underscores.
bool IsWordAt(std::string_view text, std::size_t offset);

enum class LetterCase { kUpper, kLower, kTitle };  // title: words begin with a capital
// Maps one character to one character, so "ß" has no capital. Invalid bytes stay.
std::string WithCase(std::string_view text, LetterCase letterCase);
