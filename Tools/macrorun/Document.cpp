// SPDX-License-Identifier: MIT
#include "Document.h"

#include <algorithm>
#include <utility>

Document::Document(std::string_view bytes) {
  while (!bytes.empty()) {
    const std::size_t end = bytes.find('\n');
    lastLineEnds = end != bytes.npos;
    std::string_view text = bytes.substr(0, end);
    bytes.remove_prefix(lastLineEnds ? end + 1 : bytes.size());
    const bool crlf = lastLineEnds && text.ends_with('\r');
    if (crlf) text.remove_suffix(1);
    if (lines.empty()) newLinesCrlf = crlf;
    lines.push_back({std::string(text), lastLineEnds ? crlf : newLinesCrlf});
  }
}

std::string Document::Bytes() const {
  std::string bytes;
  for (const TextLine& line : lines) {
    bytes += line.text;
    if (&line != &lines.back() || lastLineEnds) bytes += line.crlf ? "\r\n" : "\n";
  }
  return bytes;
}

void Document::SetLine(std::size_t line, std::string text) {
  if (cursorLine == line) cursorColumn = std::min(cursorColumn, text.size() + 1);
  lines[line - 1].text = std::move(text);
}

void Document::InsertLine(std::size_t line, std::string text) {
  const auto place = lines.begin() + static_cast<std::ptrdiff_t>(line - 1);
  lines.insert(place, {std::move(text), newLinesCrlf});
  if (cursorLine >= line) ++cursorLine;
}

void Document::DeleteLine(std::size_t line) {
  lines.erase(lines.begin() + static_cast<std::ptrdiff_t>(line - 1));
  if (cursorLine == line) cursorColumn = 1;
  if (cursorLine > line) --cursorLine;
}

void Document::GoToLine(std::size_t line) {
  cursorLine = line;
  cursorColumn = 1;
}

void Document::Write(std::string_view text) {
  if (text.empty()) return;
  if (cursorLine > lines.size()) {
    lines.push_back({"", newLinesCrlf});
    lastLineEnds = false;
  }
  for (;;) {
    const std::size_t end = text.find('\n');
    std::string_view piece = text.substr(0, end);
    if (end != text.npos && piece.ends_with('\r')) piece.remove_suffix(1);
    lines[cursorLine - 1].text.insert(cursorColumn - 1, piece);
    cursorColumn += piece.size();
    if (end == text.npos) break;
    SplitLineAtCursor();
    text.remove_prefix(end + 1);
  }
  // A line end written last has ended the last line, not begun another.
  if (cursorLine == lines.size() && lines.back().text.empty() && !lastLineEnds) {
    lines.pop_back();
    lastLineEnds = true;
  }
}

void Document::SplitLineAtCursor() {
  TextLine& line = lines[cursorLine - 1];
  TextLine rest{line.text.substr(cursorColumn - 1), line.crlf};
  line.text.resize(cursorColumn - 1);
  line.crlf = newLinesCrlf;
  lines.insert(lines.begin() + static_cast<std::ptrdiff_t>(cursorLine), std::move(rest));
  GoToLine(cursorLine + 1);
}
