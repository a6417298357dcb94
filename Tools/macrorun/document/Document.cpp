// SPDX-License-Identifier: MIT
#include "document/Document.h"

#include <algorithm>
#include <utility>

#include "document/Characters.h"

namespace {

// The parts between the line ends; at least one.
std::vector<std::string_view> Pieces(std::string_view text) {
  std::vector<std::string_view> pieces;
  for (;;) {
    const std::size_t end = text.find('\n');
    std::string_view piece = text.substr(0, end);
    if (end != text.npos && piece.ends_with('\r')) piece.remove_suffix(1);
    pieces.push_back(piece);
    if (end == text.npos) return pieces;
    text.remove_prefix(end + 1);
  }
}

// The new position of `place` after the text from `from` to `to` became one that ends at `end`.
Position Moved(Position place, const Edit::Change& change, bool forward) {
  const Position to = forward ? change.to : change.end;
  const Position end = forward ? change.end : change.to;
  if (change.wholeLines) {
    if (place.line >= to.line) return {place.line - to.line + end.line, place.offset};
    return place.line < end.line ? place : Position{end.line, 0};
  }
  if (place < to) return std::min(place, change.from);
  if (place.line != to.line) return {place.line - to.line + end.line, place.offset};
  return {end.line, place.offset - to.offset + end.offset};
}

}  // namespace

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

Position Document::TextEnd() const {
  return lastLineEnds || lines.empty() ? End() : Position{lines.size(), lines.back().text.size()};
}

Position Document::EndOfLine(std::size_t line) const {
  return {line, line > lines.size() ? 0 : Line(line).size()};
}

std::string Document::Text(Range range) const {
  const auto [from, to] = range;
  if (from.line > lines.size()) return {};
  if (from.line == to.line) return Line(from.line).substr(from.offset, to.offset - from.offset);
  std::string text = Line(from.line).substr(from.offset);
  for (std::size_t line = from.line + 1; line < to.line; ++line) text += "\n" + Line(line);
  if (to.line <= lines.size()) return text + "\n" + Line(to.line).substr(0, to.offset);
  return lastLineEnds ? text + "\n" : text;
}

const FlatText& Document::Flat() const {
  if (flat) return *flat;
  flat.emplace();
  for (const TextLine& line : lines) {
    flat->starts.push_back(flat->text.size());
    flat->text += line.text;
    if (&line != &lines.back() || lastLineEnds) flat->text += '\n';
  }
  flat->starts.push_back(flat->text.size());
  flat->utf8 = IsValidUtf8(flat->text);
  return *flat;
}

std::size_t Document::FlatOffset(Position position) const {
  return Flat().starts[position.line - 1] + position.offset;
}

Position Document::FromFlat(std::size_t offset) const {
  const std::vector<std::size_t>& starts = Flat().starts;
  if (offset == Flat().text.size()) return TextEnd();
  const auto next = std::upper_bound(starts.begin(), starts.end(), offset);
  return {static_cast<std::size_t>(next - starts.begin()), offset - *(next - 1)};
}

void Document::ReplaceLines(std::size_t first, std::size_t count, std::vector<std::string> texts) {
  Edit edit;
  edit.first = first;
  edit.changes = {{{first, 0}, {first + count, 0}, {first + texts.size(), 0}, true}};
  edit.after.lastLineEnds = lastLineEnds;
  const auto old = lines.begin() + static_cast<std::ptrdiff_t>(first - 1);
  edit.before.lines.assign(old, old + static_cast<std::ptrdiff_t>(count));
  for (std::size_t i = 0; i < texts.size(); ++i)
    edit.after.lines.push_back(
        {std::move(texts[i]), i < count ? edit.before.lines[i].crlf : newLinesCrlf});
  Apply(std::move(edit));
}

void Document::ReorderLines(std::size_t first, std::vector<std::size_t> order) {
  Edit edit;
  edit.first = first;
  edit.after.lastLineEnds = lastLineEnds;
  for (std::size_t i = 0; i < order.size(); ++i) {
    const TextLine& line = lines[first - 1 + i];
    edit.before.lines.push_back(line);
    edit.after.lines.push_back({lines[first - 1 + order[i]].text, line.crlf});
  }
  edit.order = std::move(order);
  Apply(std::move(edit));
}

// Builds new lines from old text and replacements.
struct Document::NewText {
  const Document& document;
  std::vector<TextLine> done;
  std::string open;  // the unfinished line

  void AddOld(Position from, Position to) {
    for (; from.line < to.line; from = {from.line + 1, 0}) {
      open.append(document.Line(from.line), from.offset);
      done.push_back({std::exchange(open, {}), document.lines[from.line - 1].crlf});
    }
    if (from < to) open.append(document.Line(from.line), from.offset, to.offset - from.offset);
  }
  // Returns the change that the replacement makes.
  Edit::Change Add(const Replacement& replacement) {
    const std::vector<std::string_view> pieces = Pieces(replacement.text);
    for (const std::string_view& piece : pieces) {
      open += piece;
      if (&piece != &pieces.back())
        done.push_back({std::exchange(open, {}), document.newLinesCrlf});
    }
    const Position from = replacement.range.from;
    Position end = {from.line + pieces.size() - 1, pieces.back().size()};
    if (pieces.size() == 1) end.offset += from.offset;
    return {from, replacement.range.to, end, false};
  }
};

void Document::Replace(const std::vector<Replacement>& replacements) {
  if (replacements.empty()) return;
  const Replacement& only = replacements.front();
  if (replacements.size() == 1 && only.text.empty() && only.range.from == only.range.to) return;
  Edit edit;
  edit.first = replacements.front().range.from.line;
  NewText text{*this, {}, {}};
  Position at = {edit.first, 0};
  for (const Replacement& replacement : replacements) {
    text.AddOld(at, replacement.range.from);
    edit.changes.push_back(text.Add(replacement));
    at = replacement.range.to;
  }
  text.AddOld(at, EndOfLine(at.line));
  const std::size_t last = std::min(at.line, lines.size());
  const bool ended = at.line <= lines.size() && (at.line < lines.size() || lastLineEnds);
  // A line end at the end of the text ends the last line and does not start another.
  edit.after.lastLineEnds = at.line < lines.size() ? lastLineEnds : ended || text.open.empty();
  const bool crlf = at.line <= lines.size() ? lines[last - 1].crlf : newLinesCrlf;
  if (ended || !text.open.empty()) text.done.push_back({std::move(text.open), crlf});
  const auto begin = lines.begin();
  edit.before.lines.assign(begin + static_cast<std::ptrdiff_t>(std::min(edit.first - 1, last)),
                           begin + static_cast<std::ptrdiff_t>(last));
  edit.after.lines = std::move(text.done);
  Apply(std::move(edit));
}

void Document::Write(std::string_view text) {
  const Range selection = Selection();
  if (!text.empty() || HasSelection()) Replace({{selection, std::string(text)}});
  places.anchor.reset();
}

void Document::MoveCursor(Position position) {
  places.cursor = position;
  places.anchor.reset();
}

void Document::Select(Range range) {
  places.anchor = range.from;
  places.cursor = range.to;
}

std::optional<Position> Document::Mark(const std::string& name) const {
  const auto mark = places.marks.find(name);
  if (mark == places.marks.end()) return {};
  return mark->second;
}

void Document::Apply(Edit edit) {
  edit.before.lastLineEnds = lastLineEnds;
  edit.before.cursor = places.cursor;
  edit.before.anchor = places.anchor;
  Exchange(edit, true);
  MovePlaces(edit, true);
  edit.after.cursor = places.cursor;
  edit.after.anchor = places.anchor;
  const bool same =
      edit.before.lines == edit.after.lines && edit.before.lastLineEnds == edit.after.lastLineEnds;
  if (!same) history.Add(std::move(edit));
}

// Replaces `count` lines, which are not the last ones.
static void UpdateFlat(FlatText& flatText, std::size_t first, std::size_t count,
                       const std::vector<TextLine>& now) {
  auto& [text, starts, utf8] = flatText;
  const auto place = starts.begin() + static_cast<std::ptrdiff_t>(first - 1);
  const auto rest = place + static_cast<std::ptrdiff_t>(count);
  const std::size_t begin = *place, end = *rest;
  std::string newText;
  std::vector<std::size_t> newStarts;
  for (const TextLine& line : now) {
    newStarts.push_back(begin + newText.size());
    newText += line.text + '\n';
  }
  utf8 = utf8 && IsValidUtf8(newText);
  for (auto start = rest; start != starts.end(); ++start)
    *start = *start - end + begin + newText.size();
  text.replace(begin, end - begin, newText);
  starts.insert(starts.erase(place, rest), newStarts.begin(), newStarts.end());
}

void Document::Exchange(const Edit& edit, bool forward) {
  const Edit::State& old = forward ? edit.before : edit.after;
  const Edit::State& now = forward ? edit.after : edit.before;
  const bool endsStay = old.lastLineEnds == now.lastLineEnds;
  if (flat && endsStay && edit.first - 1 + old.lines.size() < lines.size())
    UpdateFlat(*flat, edit.first, old.lines.size(), now.lines);
  else
    flat.reset();
  const std::size_t common = std::min(old.lines.size(), now.lines.size());
  const auto place = lines.begin() + static_cast<std::ptrdiff_t>(edit.first - 1);
  const auto source = now.lines.begin();
  const auto count = static_cast<std::ptrdiff_t>(common);
  std::copy(source, source + count, place);
  if (old.lines.size() > common)
    lines.erase(place + count, place + static_cast<std::ptrdiff_t>(old.lines.size()));
  else
    lines.insert(place + count, source + count, now.lines.end());
  lastLineEnds = now.lastLineEnds;
}

void Document::MovePlaces(const Edit& edit, bool forward) {
  std::vector<std::size_t> moved(edit.order.size());  // the new index of each line
  for (std::size_t i = 0; i < moved.size(); ++i)
    moved[forward ? edit.order[i] : i] = forward ? i : edit.order[i];
  const auto move = [&](Position& place) {
    if (place.line >= edit.first && place.line - edit.first < moved.size())
      place.line = edit.first + moved[place.line - edit.first];
    // Each change is in coordinates that hold when the changes are applied in this order.
    if (forward)
      for (auto change = edit.changes.rbegin(); change != edit.changes.rend(); ++change)
        place = Moved(place, *change, true);
    else
      for (const Edit::Change& change : edit.changes) place = Moved(place, change, false);
    place = NearestCharacter(place);
  };
  move(places.cursor);
  if (places.anchor) move(*places.anchor);
  // A selection whose ends were exchanged by a reordering is dropped.
  if (places.anchor > places.cursor) places.anchor.reset();
  for (auto& [name, place] : places.marks) move(place);
}

Position Document::NearestCharacter(Position place) const {
  if (place.line > lines.size()) return std::min(place, End());
  const std::string& text = Line(place.line);
  place.offset = std::min(place.offset, text.size());
  while (place.offset > 0 && !IsCharacterStart(text, place.offset)) --place.offset;
  return place;
}

bool Document::Undo() {
  const Step* step = history.Undo();
  if (!step) return false;
  for (auto edit = step->rbegin(); edit != step->rend(); ++edit) {
    Exchange(*edit, false);
    MovePlaces(*edit, false);
    places.cursor = edit->before.cursor;
    places.anchor = edit->before.anchor;
  }
  return true;
}

bool Document::Redo() {
  const Step* step = history.Redo();
  if (!step) return false;
  for (const Edit& edit : *step) {
    Exchange(edit, true);
    MovePlaces(edit, true);
    places.cursor = edit.after.cursor;
    places.anchor = edit.after.anchor;
  }
  return true;
}
