// SPDX-License-Identifier: MIT
// Line ends, and the limit of the undo history.
#include <gtest/gtest.h>

#include "document/Document.h"

namespace {

TEST(DocumentTest, LineEndsStayAsTheyAre) {
  for (const char* bytes : {"", "\n", "\r\n", "a", "a\n", "a\r\nb\nc", "\r\n\n\r", "a\r", "\n\n"}) {
    Document document(bytes);
    EXPECT_EQ(document.Bytes(), bytes);
    document.Replace({{{{}, {}}, ""}});
    EXPECT_EQ(document.Bytes(), bytes);
  }
}

TEST(DocumentTest, NewLinesEndAsTheFirstDoesAndOldOnesKeepTheirs) {
  struct Row {
    const char* before;
    std::vector<Replacement> replacements;
    const char* after;
  };
  const Row rows[] = {
      {"a\r\nb\n", {{{{1, 0}, {1, 0}}, "x\ny"}}, "x\r\nya\r\nb\n"},
      {"a\nb\r\nc", {{{{1, 1}, {2, 0}}, ""}}, "ab\r\nc"},
      {"a\nb\r\nc", {{{{2, 1}, {2, 1}}, "1\r\n2"}}, "a\nb1\n2\r\nc"},
      {"a\nb", {{{{2, 1}, {2, 1}}, "\n"}}, "a\nb\n"},
      {"a\nb", {{{{3, 0}, {3, 0}}, "c"}}, "a\nb\nc"},
      {"a\nb", {{{{3, 0}, {3, 0}}, "c\n"}}, "a\nb\nc\n"},
      {"a\nb\n", {{{{2, 1}, {3, 0}}, ""}}, "a\nb"},
      {"a\n\n", {{{{2, 0}, {3, 0}}, ""}}, "a\n"},
      {"a\nb", {{{{1, 1}, {2, 1}}, ""}}, "a"},
      {"a\nb", {{{{2, 0}, {2, 1}}, ""}}, "a\n"},
      {"a\r\nb\n", {{{{1, 0}, {3, 0}}, ""}}, ""},
      {"a\r\nb\r\n",
       {{{{1, 0}, {1, 1}}, "1\n"}, {{{2, 0}, {2, 1}}, "2\n3"}},
       "1\r\n\r\n2\r\n3\r\n"},
  };
  for (const Row& row : rows) {
    SCOPED_TRACE(row.before);
    Document document(row.before);
    document.Replace(row.replacements);
    EXPECT_EQ(document.Bytes(), row.after);
    EXPECT_TRUE(document.Undo());
    EXPECT_EQ(document.Bytes(), row.before);
    EXPECT_TRUE(document.Redo());
    EXPECT_EQ(document.Bytes(), row.after);
  }
}

// A step is undone completely or not at all.
TEST(DocumentTest, AStepThatIsTooLargeIsForgotten) {
  Document document("a\n");
  document.ReplaceLines(1, 1, {"b"});
  document.BeginStep();
  for (std::size_t i = 0; i < 40; ++i)
    document.ReplaceLines(1, 1, {std::string(kHistoryLimit / 32, static_cast<char>('c' + i % 9))});
  EXPECT_TRUE(document.Undo());
  document.EndStep();
  EXPECT_FALSE(document.Undo());
  document.ReplaceLines(1, 1, {"d"});
  EXPECT_TRUE(document.Undo());
  EXPECT_FALSE(document.Undo());
}

}  // namespace
