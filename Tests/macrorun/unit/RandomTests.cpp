// SPDX-License-Identifier: MIT
// Random calls of all functions that change documents.
#include <gtest/gtest.h>

#include <random>

#include "FunctionTable.h"
#include "document/Characters.h"

namespace {

class Random {
 public:
  explicit Random(std::uint32_t seed) : engine(seed) {}
  std::size_t Below(std::size_t limit) { return engine() % limit; }
  template <class List>
  auto& Of(List& list) {
    return list[Below(std::size(list))];
  }
  std::string Text() {
    static const char* const pieces[] = {"a", "B c",  "ä",  "\n", "\r\n",
                                         " ", "\xff", "😀", "\t", "a"};
    std::string text;
    for (std::size_t i = Below(6); i > 0; --i) text += Of(pieces);
    return text;
  }
  // Mostly a valid argument.
  std::string Argument(ParameterKind kind, const Document& document) {
    static const char* const words[] = {"",          "ignore_case", "wrap",
                                        "selection", "unique",      "backward"};
    static const char* const names[] = {"a", "ä", "\\s*", "^", "[^a]+", "(", "m"};
    switch (kind) {
      case ParameterKind::kLine:
      case ParameterKind::kLineOrEnd:
      case ParameterKind::kLastLine:
        return std::to_string(Below(document.LineCount() + 2) + (Below(9) != 0));
      case ParameterKind::kColumn:
      case ParameterKind::kCount:
        return std::to_string(Below(4) + 1);
      case ParameterKind::kWords:
        return Of(words);
      case ParameterKind::kName:
        return Of(names);
      default:
        return Text();
    }
  }

 private:
  std::mt19937 engine;
};

struct State {
  std::string bytes;
  Range selection;
  bool operator==(const State&) const = default;
};

State StateOf(const Document& document) { return {document.Bytes(), document.Selection()}; }

void ExpectSound(const Document& document) {
  const Range selection = document.Selection();
  EXPECT_LE(selection.from, selection.to);
  for (const Position place : {selection.from, selection.to}) {
    ASSERT_LE(place, document.EndOfLine(place.line));
    ASSERT_LE(place, document.End());
  }
  const Document fresh(document.Bytes());
  EXPECT_EQ(fresh.Bytes(), document.Bytes());
  EXPECT_EQ(fresh.Flat().text, document.Flat().text);
  EXPECT_LE(document.Flat().utf8, fresh.Flat().utf8);
  EXPECT_EQ(document.FromFlat(document.FlatOffset(selection.to)),
            std::min(selection.to, document.TextEnd()));
  for (std::size_t line = 1; line <= document.LineCount(); ++line)
    EXPECT_EQ(document.Line(line).find('\n'), std::string::npos);
}

Call RandomCall(Random& random, const Document& document) {
  const std::span<const MacroFunction> functions = MacroFunctions();
  for (;;) {
    const MacroFunction& function = random.Of(functions);
    const std::string group = function.group;
    if (group == "Documents" || group == "Macro" || group == "Undo") continue;
    Call call = {function.name, {}};
    for (const MacroParameter& parameter : function.parameters) {
      if (parameter.Optional() && random.Below(2) == 0) break;
      call.arguments.push_back(random.Argument(parameter.kind, document));
    }
    return call;
  }
}

// Undo and redo restore each earlier state. A refused call changes nothing.
TEST(RandomTest, UndoRedoAndRefusals) {
  std::size_t refused = 0, changed = 0;
  for (std::uint32_t seed = 0; seed < 1500 && !HasFailure(); ++seed) {
    SCOPED_TRACE(seed);
    Random random(seed);
    FakeServices services;
    Editor editor(Document(random.Text() + random.Text()));
    Document& document = editor.First();
    std::vector<std::string> before, after;
    for (std::size_t i = 0; i < 12; ++i) {
      const Call call = RandomCall(random, document);
      SCOPED_TRACE(call.function);
      const State old = StateOf(document);
      const std::size_t lines = document.LineCount();
      const std::size_t depth = random.Below(3);
      for (std::size_t d = 0; d < depth; ++d) editor.BeginStep();
      try {
        Do(editor, services, call);
      } catch (const WrongCall&) {
        ++refused;
        EXPECT_EQ(StateOf(document), old);
      }
      for (std::size_t d = 0; d < depth; ++d) editor.EndStep();
      ExpectSound(document);
      if (document.Bytes() == old.bytes && document.LineCount() == lines) continue;
      ++changed;
      before.push_back(old.bytes);
      after.push_back(document.Bytes());
    }
    for (std::size_t i = before.size(); i-- > 0;) {
      EXPECT_TRUE(document.Undo());
      ExpectSound(document);
      EXPECT_EQ(document.Bytes(), before[i]);
    }
    EXPECT_FALSE(document.Undo());
    for (const std::string& bytes : after) {
      EXPECT_TRUE(document.Redo());
      ExpectSound(document);
      EXPECT_EQ(document.Bytes(), bytes);
    }
    EXPECT_FALSE(document.Redo());
  }
  EXPECT_GT(refused, 1000u);
  EXPECT_GT(changed, 3000u);
}

// Compares the text and a mark with a model without lines.
TEST(RandomTest, ReplaceAgainstAPlainText) {
  for (std::uint32_t seed = 0; seed < 3000 && !HasFailure(); ++seed) {
    SCOPED_TRACE(seed);
    Random random(seed);
    Document document(random.Text() + "x" + random.Text());
    std::string text = document.Flat().text;
    std::vector<std::size_t> cuts;
    for (std::size_t i = 2 * (1 + random.Below(2)); i > 0; --i)
      cuts.push_back(OffsetOfCharacter(text, random.Below(text.size() + 1)));
    std::sort(cuts.begin(), cuts.end());
    const std::size_t mark = OffsetOfCharacter(text, random.Below(text.size()));
    document.MoveCursor(document.FromFlat(mark));
    std::vector<Replacement> replacements;
    for (std::size_t i = 0; i < cuts.size(); i += 2)
      replacements.push_back(
          {{document.FromFlat(cuts[i]), document.FromFlat(cuts[i + 1])}, random.Text()});
    std::size_t expected = mark;
    for (std::size_t i = replacements.size(); i-- > 0;) {
      std::string inserted = replacements[i].text;
      while (inserted.find("\r\n") != inserted.npos) inserted.erase(inserted.find("\r\n"), 1);
      const std::size_t from = cuts[2 * i], to = cuts[2 * i + 1];
      text.replace(from, to - from, inserted);
      if (expected >= to)
        expected = expected - (to - from) + inserted.size();
      else if (expected > from)
        expected = from;
    }
    document.Replace(replacements);
    EXPECT_EQ(document.Flat().text, text);
    EXPECT_EQ(document.FlatOffset(document.Cursor()), expected);
  }
}

}  // namespace
