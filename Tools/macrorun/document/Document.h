// SPDX-License-Identifier: MIT
// The text that a macro works on: lines of bytes, a cursor, a selection and marks, and the way back
// to earlier states.
//
// A position is a line and an offset in it, in bytes. Lines count from 1. The last position of a
// text is the start of the line that would follow the last one, LineCount() + 1.
//
// A line ends in LF or CRLF, and each line keeps its own end; a new one gets the end of the text's
// first line (LF when there is none). Whether the last line has an end at all is kept too,
// whichever line is last: only Replace changes it, by writing or deleting at the end. So Bytes() of
// an untouched document is what it was made from.
//
// Cursor, selection and marks stay with the character that they stand before when text comes or
// goes elsewhere; those in a text that is replaced or deleted see Replace and ReplaceLines.
//
// Preconditions are the caller's to check: lines are from 1 to LineCount() unless stated otherwise,
// offsets from 0 to the line's length, and ranges are not backwards.
#pragma once

#include <cstddef>
#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "document/History.h"
#include "document/Position.h"

class Document {
 public:
  explicit Document(std::string_view bytes);
  std::string Bytes() const;

  std::size_t LineCount() const { return lines.size(); }
  const std::string& Line(std::size_t line) const { return lines[line - 1].text; }  // without end
  Position End() const { return {lines.size() + 1, 0}; }
  // The place behind the last character; End() when that is a line end.
  Position TextEnd() const;
  // The end of the line; of LineCount() + 1 its start.
  Position EndOfLine(std::size_t line) const;
  // With a line feed for each line end.
  std::string Text(Range range) const;
  // The whole text likewise.
  const FlatText& Flat() const;
  std::size_t FlatOffset(Position position) const;
  Position FromFlat(std::size_t offset) const;

  // Replaces whole lines; `first` may be LineCount() + 1 when `count` is 0. A text holds no line
  // feed. Lines keep their ends as far as there are as many. A position in a replaced line stays in
  // the line that takes its place, at the nearest offset; without one it goes to the start of the
  // line that follows.
  void ReplaceLines(std::size_t first, std::size_t count, std::vector<std::string> texts);
  // Puts lines in another order: the line at `first` + i becomes the one that was at `first` +
  // `order`[i]. Positions stay with the line's text.
  void ReorderLines(std::size_t first, std::vector<std::size_t> order);
  // Replaces ranges, which are in order and do not overlap. A LF or CRLF in a text ends a line. A
  // position inside a replaced range goes to its start, the one at its end to the new text's end.
  void Replace(const std::vector<Replacement>& replacements);
  // Deletes the selection, inserts `text` at the cursor and moves the cursor behind it.
  void Write(std::string_view text);

  Position Cursor() const { return places.cursor; }
  // Ends the selection.
  void MoveCursor(Position position);
  // The cursor is at the range's end.
  void Select(Range range);
  // Empty at the cursor when nothing is selected.
  Range Selection() const { return {places.anchor.value_or(places.cursor), places.cursor}; }
  bool HasSelection() const { return places.anchor && *places.anchor != places.cursor; }

  void SetMark(const std::string& name) { places.marks[name] = places.cursor; }
  std::optional<Position> Mark(const std::string& name) const;
  bool DeleteMark(const std::string& name) { return places.marks.erase(name) != 0; }

  // Between the two all changes are one step; steps nest.
  void BeginStep() { history.Begin(); }
  void EndStep() { history.End(); }
  // Takes back, or does again, the last step that has ended. Text, cursor and selection become what
  // they were at its first, or after its last change; marks move with the text. False: there is
  // none. A replacement that leaves the same text is no change.
  bool Undo();
  bool Redo();

 private:
  struct Places {
    Position cursor;
    std::optional<Position> anchor;  // never behind the cursor
    std::map<std::string, Position> marks;
  };

  struct NewText;
  void Apply(Edit edit);
  // Puts an edit's new lines into the place of its old ones, or the other way round.
  void Exchange(const Edit& edit, bool forward);
  void MovePlaces(const Edit& edit, bool forward);
  Position NearestCharacter(Position place) const;

  std::vector<TextLine> lines;
  bool newLinesCrlf = false;
  bool lastLineEnds = true;
  Places places;
  History history;
  mutable std::optional<FlatText> flat;  // made when asked for
};
