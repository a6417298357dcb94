// SPDX-License-Identifier: MIT
// Moves a position by characters and words. A line end is one character.
#pragma once

#include "document/Document.h"

// The position after the next or before the previous character; unchanged when there is none.
Position NextCharacter(const Document& document, Position place);
Position PreviousCharacter(const Document& document, Position place);

// The start of the next word, or the end of the text. The start of the current or previous word, or
// the start of the text.
Position NextWord(const Document& document, Position place);
Position PreviousWord(const Document& document, Position place);

// The word at the position or directly before it; empty when there is none.
Range WordAround(const Document& document, Position place);

// In characters, from 1.
std::size_t ColumnOf(const Document& document, Position place);
