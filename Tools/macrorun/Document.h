// SPDX-License-Identifier: MIT
// The text that a macro works on: lines of bytes and a cursor.
//
// Lines and columns count from 1, columns in bytes. A line ends in LF or CRLF, and each line keeps
// its own end; a new one gets the end of the text's first line (LF when there is none). Whether the
// last line has an end at all is kept too, whichever line is last: only Write changes it, by
// writing at the end. So Bytes() of an untouched document is what it was made from.
//
// The cursor stands in a line, or in front of the line that would follow the last one. It stays
// with its text when lines come or go before it; when its own line is deleted it moves to the start
// of the line that takes the place.
//
// Preconditions are the caller's to check: `line` is from 1 to LineCount() unless stated otherwise.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

class Document {
 public:
  explicit Document(std::string_view bytes);
  std::string Bytes() const;

  std::size_t LineCount() const { return lines.size(); }
  const std::string& Line(std::size_t line) const { return lines[line - 1].text; }  // without end

  // `text` holds no line feed.
  void SetLine(std::size_t line, std::string text);
  // The new line stands before `line`; LineCount() + 1 appends it.
  void InsertLine(std::size_t line, std::string text);
  void DeleteLine(std::size_t line);

  // Puts the cursor at the start of `line`; LineCount() + 1 is the end of the text.
  void GoToLine(std::size_t line);
  // Inserts `text` at the cursor and moves the cursor behind it. Each LF or CRLF in it ends a line.
  void Write(std::string_view text);

 private:
  struct TextLine {
    std::string text;
    bool crlf;
  };
  void SplitLineAtCursor();

  std::vector<TextLine> lines;
  bool newLinesCrlf = false;
  bool lastLineEnds = true;
  std::size_t cursorLine = 1;    // 1 to LineCount() + 1
  std::size_t cursorColumn = 1;  // 1 to the line's length + 1
};
