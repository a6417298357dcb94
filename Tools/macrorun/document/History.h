// SPDX-License-Identifier: MIT
// The undo history of a document.
//
// Steps nest. An inner step that has ended can be undone until the outer one ends. A step without a
// change is not recorded. Above kHistoryLimit bytes the history drops all earlier steps. It also
// drops the steps that are open then when they end, because undoing a part of a step would leave a
// mixed text.
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

// One change of a document: the old and the new lines, and how positions in them moved.
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
  std::vector<Change> changes;     // sorted; positions assume only the later ones
  std::vector<std::size_t> order;  // of reordered lines: the old index of each, from `first`
  State before, after;
};

using Step = std::vector<Edit>;

constexpr std::size_t kHistoryLimit = 64u << 20;

class History {
 public:
  void Begin() { open.push_back({undo.size(), false}); }
  void End();
  // A change outside of any step is one step. Clears the redo list.
  void Add(Edit edit);

  // Moves a step to the other list and returns it; null when there is none.
  const Step* Undo();
  const Step* Redo();

 private:
  struct OpenStep {
    std::size_t start;  // index in `undo`
    bool cut;           // a part was dropped
  };
  void Forget();

  std::vector<Step> undo, redo;
  std::vector<OpenStep> open;
  std::size_t bytes = 0;  // estimate for `undo`
};
