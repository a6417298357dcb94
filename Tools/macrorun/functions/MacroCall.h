// SPDX-License-Identifier: MIT
// One call of a macro function: its checked arguments, the editor and the services.
#pragma once

#include <cstddef>
#include <span>

#include "functions/ArgumentCheck.h"

// Documents are shorter than the largest integer of a script.
inline MacroResult Answer(std::size_t number) { return static_cast<std::int32_t>(number); }

class MacroCall : public ArgumentCheck {
 public:
  // Checks the arguments. Throws WrongCall.
  MacroCall(const MacroFunction& function, Editor& editor, EditorServices& services,
            std::span<const HostArgument> arguments);

  Editor& editor;
  EditorServices& services;
  Document& document() { return editor.Current(); }

  // The position given by the arguments line and column.
  Position At(std::size_t lineIndex) const;
  // The line of an optional argument, by default the cursor's. Throws WrongCall when that does not
  // exist.
  std::size_t LineOrCursor(std::size_t index);
};
