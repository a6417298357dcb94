// SPDX-License-Identifier: MIT
// What a document's changes need to be taken back.
//
// Steps nest, and an inner step that has ended can be taken back on its own until the outer one
// ends. A step that makes no change leaves nothing. The history forgets when it holds more than
// kHistoryLimit bytes: everything before, and at their end the steps that were open then, since a
// part of a step is not to be taken back as if it were the whole.
#pragma once

#include <cstddef>
#include <optional>
#include <string>
#include <vector>

#include "document/Position.h"

struct TextLine {
  std::string text;
  bool crlf;
  bool operator==(const TextLine&) const = default;
};

// One change of a document: old lines for new ones, and which places in them moved where.
struct Edit {
  struct Change {
    Position from, to, end;  // the old text was from `from` to `to`, the new one ends at `end`
    bool wholeLines;
  };
  struct State {
    std::vector<TextLine> lines;
    bool lastLineEnds;
    Position cursor;
    std::optional<Position> anchor;
  };

  std::size_t first;               // line
  std::vector<Change> changes;     // in order, each as if those behind it were made and no other
  std::vector<std::size_t> order;  // of lines that changed places: where each was, from `first`
  State before, after;
};

using Step = std::vector<Edit>;

constexpr std::size_t kHistoryLimit = 64u << 20;

class History {
 public:
  void Begin() { open.push_back({undo.size(), false}); }
  void End();
  // A change outside of any step is a step of its own. Forgets what Undo took back.
  void Add(Edit edit);

  // The step to take back or to do again; null: none. The history counts it as done.
  const Step* Undo();
  const Step* Redo();

 private:
  struct OpenStep {
    std::size_t start;  // its part of `undo`
    bool cut;           // some of it is forgotten
  };
  void Forget();

  std::vector<Step> undo, redo;
  std::vector<OpenStep> open;
  std::size_t bytes = 0;  // of `undo`, about
};
