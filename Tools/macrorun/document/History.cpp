// SPDX-License-Identifier: MIT
#include "document/History.h"

#include <algorithm>
#include <iterator>
#include <utility>

namespace {

std::size_t Bytes(const std::vector<TextLine>& lines) {
  std::size_t bytes = 0;
  for (const TextLine& line : lines) bytes += sizeof line + line.text.size();
  return bytes;
}

std::size_t Bytes(const Edit& edit) {
  return sizeof edit + edit.changes.size() * sizeof(Edit::Change) + Bytes(edit.before.lines) +
         Bytes(edit.after.lines);
}

}  // namespace

void History::End() {
  const OpenStep step = open.back();
  open.pop_back();
  if (step.cut) {
    Forget();
    return;
  }
  if (undo.size() < step.start + 2) return;
  const auto whole = undo.begin() + static_cast<std::ptrdiff_t>(step.start);
  for (auto part = whole + 1; part != undo.end(); ++part)
    std::move(part->begin(), part->end(), std::back_inserter(*whole));
  undo.erase(whole + 1, undo.end());
}

void History::Add(Edit edit) {
  redo.clear();
  bytes += Bytes(edit);
  if (bytes > kHistoryLimit) Forget();
  undo.emplace_back();
  undo.back().push_back(std::move(edit));
}

void History::Forget() {
  undo.clear();
  bytes = 0;
  for (OpenStep& step : open) step = {0, true};
}

const Step* History::Undo() {
  if (undo.empty()) return nullptr;
  for (const Edit& edit : undo.back()) bytes -= std::min(bytes, Bytes(edit));
  redo.push_back(std::move(undo.back()));
  undo.pop_back();
  for (OpenStep& step : open) step.start = std::min(step.start, undo.size());
  return &redo.back();
}

const Step* History::Redo() {
  if (redo.empty()) return nullptr;
  for (const Edit& edit : redo.back()) bytes += Bytes(edit);
  undo.push_back(std::move(redo.back()));
  redo.pop_back();
  return &undo.back();
}
