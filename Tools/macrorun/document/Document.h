// SPDX-License-Identifier: MIT
// The text that a macro works on: lines of bytes, a cursor, a selection, marks and an undo history.
//
// A position is a line and an offset in it, in bytes. Lines count from 1. The last position of a
// text is the start of the line after the last one, LineCount() + 1.
//
// A line ends in LF or CRLF, and keeps that end. A new line gets the end of the text's first line
// (LF when there is none). The document remembers whether its last line has an end; only Replace
// changes that, by writing or deleting at the end. So Bytes() of an unchanged document returns the
// original bytes.
//
// Cursor, selection and marks keep their character when text before them changes. For positions in
// a replaced or deleted text see Replace and ReplaceLines.
//
// The caller checks the preconditions: lines are from 1 to LineCount() unless stated otherwise,
// offsets from 0 to the line's length, and ranges are not reversed.
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
  // The position after the last character; End() when that is a line end.
  Position TextEnd() const;
  // The end of the line; for LineCount() + 1 its start.
  Position EndOfLine(std::size_t line) const;
  // With a line feed for each line end.
  std::string Text(Range range) const;
  // The whole text in that form.
  const FlatText& Flat() const;
  std::size_t FlatOffset(Position position) const;
  Position FromFlat(std::size_t offset) const;

  // Replaces whole lines; `first` may be LineCount() + 1 when `count` is 0. A text holds no line
  // feed. Replaced lines keep their line ends. A position in a replaced line stays in the line of
  // the same number, at the nearest offset; if that line is gone, it moves to the start of the next
  // one.
  void ReplaceLines(std::size_t first, std::size_t count, std::vector<std::string> texts);
  // Reorders lines: line `first` + i becomes the former line `first` + `order`[i]. Positions stay
  // with their line's text.
  void ReorderLines(std::size_t first, std::vector<std::size_t> order);
  // Replaces ranges, which are sorted and do not overlap. A LF or CRLF in a text ends a line. A
  // position inside a replaced range moves to its start, one at its end to the new text's end.
  void Replace(const std::vector<Replacement>& replacements);
  // Replaces the selection by `text`, or inserts it at the cursor, and moves the cursor after it.
  void Write(std::string_view text);

  Position Cursor() const { return places.cursor; }
  // Ends the selection.
  void MoveCursor(Position position);
  // The cursor moves to the range's end.
  void Select(Range range);
  // Empty at the cursor when nothing is selected.
  Range Selection() const { return {places.anchor.value_or(places.cursor), places.cursor}; }
  bool HasSelection() const { return places.anchor && *places.anchor != places.cursor; }

  void SetMark(const std::string& name) { places.marks[name] = places.cursor; }
  std::optional<Position> Mark(const std::string& name) const;
  bool DeleteMark(const std::string& name) { return places.marks.erase(name) != 0; }

  // All changes between the two are one undo step. Steps nest.
  void BeginStep() { history.Begin(); }
  void EndStep() { history.End(); }
  // Undoes or redoes the last step that has ended; false when there is none. Text, cursor and
  // selection become those before its first, or after its last change; marks move with the text. A
  // replacement by the same text is not a change.
  bool Undo();
  bool Redo();

 private:
  struct Places {
    Position cursor;
    std::optional<Position> anchor;  // never after the cursor
    std::map<std::string, Position> marks;
  };

  struct NewText;
  void Apply(Edit edit);
  // Exchanges an edit's old lines for its new ones, or the reverse.
  void Exchange(const Edit& edit, bool forward);
  void MovePlaces(const Edit& edit, bool forward);
  Position NearestCharacter(Position place) const;

  std::vector<TextLine> lines;
  bool newLinesCrlf = false;
  bool lastLineEnds = true;
  Places places;
  History history;
  mutable std::optional<FlatText> flat;  // computed on demand
};
