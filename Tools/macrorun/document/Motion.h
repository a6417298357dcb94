// SPDX-License-Identifier: MIT
// Steps through a document by characters and words. A line end is one character.
#pragma once

#include "document/Document.h"

// The place behind the next, or before the previous character; the same place when there is none.
Position NextCharacter(const Document& document, Position place);
Position PreviousCharacter(const Document& document, Position place);

// The start of the next word, or the end of the text; the start of the word that the place is in or
// behind, or the start of the text.
Position NextWord(const Document& document, Position place);
Position PreviousWord(const Document& document, Position place);

// The word in which, or behind whose last character, the place is; empty at the place without one.
Range WordAround(const Document& document, Position place);

// The column, in characters from 1.
std::size_t ColumnOf(const Document& document, Position place);
