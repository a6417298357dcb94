// SPDX-License-Identifier: MIT
#include "document/Motion.h"

#include "document/Characters.h"

namespace {

bool WordAfter(const Document& document, Position place) {
  if (place >= document.EndOfLine(place.line)) return false;
  return IsWordAt(document.Line(place.line), place.offset);
}

bool WordBefore(const Document& document, Position place) {
  return place.offset > 0 && WordAfter(document, PreviousCharacter(document, place));
}

}  // namespace

Position NextCharacter(const Document& document, Position place) {
  if (place >= document.TextEnd()) return place;
  if (place == document.EndOfLine(place.line)) return {place.line + 1, 0};
  const std::string& line = document.Line(place.line);
  return {place.line, place.offset + CharacterLength(line, place.offset)};
}

Position PreviousCharacter(const Document& document, Position place) {
  if (place.offset > 0)
    return {place.line, PreviousCharacter(document.Line(place.line), place.offset)};
  return place.line > 1 ? document.EndOfLine(place.line - 1) : place;
}

Position NextWord(const Document& document, Position place) {
  while (WordAfter(document, place)) place = NextCharacter(document, place);
  while (place < document.TextEnd() && !WordAfter(document, place))
    place = NextCharacter(document, place);
  return place;
}

Position PreviousWord(const Document& document, Position place) {
  while (place > Position{} && !WordBefore(document, place))
    place = PreviousCharacter(document, place);
  while (WordBefore(document, place)) place = PreviousCharacter(document, place);
  return place;
}

Range WordAround(const Document& document, Position place) {
  Range word = {place, place};
  while (WordBefore(document, word.from)) word.from = PreviousCharacter(document, word.from);
  while (WordAfter(document, word.to)) word.to = NextCharacter(document, word.to);
  return word;
}

std::size_t ColumnOf(const Document& document, Position place) {
  if (place.line > document.LineCount()) return 1;
  return CharacterCount(std::string_view(document.Line(place.line)).substr(0, place.offset)) + 1;
}
