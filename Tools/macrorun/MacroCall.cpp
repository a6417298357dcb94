// SPDX-License-Identifier: MIT
#include "MacroCall.h"

#include "Characters.h"

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
  if (line > document().LineCount()) Fail("the cursor in a line, but it stands behind the last");
  return line;
}

std::set<std::string_view> MacroCall::Words(std::size_t index,
                                            std::initializer_list<std::string_view> allowed) {
  std::set<std::string_view> words;
  if (!Has(index)) return words;
  std::string_view rest = Text(index);
  while (rest.find_first_not_of(' ') != rest.npos) {
    rest.remove_prefix(rest.find_first_not_of(' '));
    const std::string_view word = rest.substr(0, rest.find(' '));
    rest.remove_prefix(word.size());
    std::string list;
    bool known = false;
    for (const std::string_view& candidate : allowed) {
      known = known || word == candidate;
      list += (list.empty() ? "" : ", ") + std::string(candidate);
    }
    if (!known) Fail(index, "words among " + list);
    words.insert(word);
  }
  return words;
}
