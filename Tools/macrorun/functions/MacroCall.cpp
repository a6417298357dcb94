// SPDX-License-Identifier: MIT
#include "functions/MacroCall.h"

#include "document/Characters.h"

MacroCall::MacroCall(const MacroFunction& called, Editor& owner, EditorServices& runner,
                     std::span<const HostArgument> given)
    : ArgumentCheck(called, given, &owner), editor(owner), services(runner) {}

Position MacroCall::At(std::size_t lineIndex) const {
  const std::size_t line = Number(lineIndex);
  if (line > editor.Current().LineCount()) return {line, 0};
  return {line, OffsetOfCharacter(editor.Current().Line(line), Number(lineIndex + 1) - 1)};
}

std::size_t MacroCall::LineOrCursor(std::size_t index) {
  if (Has(index)) return Number(index);
  const std::size_t line = document().Cursor().line;
  if (line > document().LineCount()) Fail("the cursor in a line, but it is after the last one");
  return line;
}
