// SPDX-License-Identifier: MIT
#include "TestSupport.h"

using StringTest = CoreTest;
using Change = void (*)(String&);

static const Text kLong(5000, 'x');
static const char* const kNull = nullptr;

static auto State(const String& s) { return std::tuple(Bytes(s), s.Capacity(), s.GrowBy()); }

TEST_F(StringTest, GrowsByItsPolicy) {
  const std::tuple<String, Change, u32, u32> cases[] = {
      {"", [](String& s) { s.Reserve(10); }, 15, 8},
      {"abc", [](String& s) { s.Reserve(3); }, 8, 8},
      {String('x', 1995), [](String& s) { s.Reserve(3000); }, 3906, 8},
      {String('x', 1019), [](String& s) { s.Reserve(3000); }, 3005, 8},
      {"abc", [](String& s) { s = "1234567"; }, 8, 4},
      {"abc", [](String& s) { s = "12345678"; }, 13, 4},
      {"abc", [](String& s) { s.EmptyReserve(3), s.EmptyReserve(4); }, 9, 4},
      {"abc", [](String& s) { s.Append("d"); }, 15, 8},
      {String("abc", 3), [](String& s) { s.Append(""), s.Insert("1234", 0); }, 8, 4},
      {"abc", [](String& s) { s.Insert("123", 0), s.InsertChar('x', 0); }, 15, 8},
      {"abc", [](String& s) { s.Insert("12", 0), s.InsertChar('x', 0), s.AppendChar('x'); }, 14, 8},
      {"abc", [](String& s) { s.Insert("12345", 0); }, 19, 8},
      {"abc", [](String& s) { s.Format("%04d", 1); }, 10, 4},
      {"abc", [](String& s) { s.At(8); }, 29, 16},
      {"abc", [](String& s) { s.ReplaceAll("b", "x"); }, 13, 16},
  };
  for (const auto& [start, change, capacity, growBy] : cases) {
    String string(start);
    change(string);
    EXPECT_EQ(State(string), std::tuple(Bytes(string), capacity, growBy));
  }
  String string;
  for (int i = 0; i < 14; ++i, string.Reserve(1)) EXPECT_EQ(string.GrowBy(), 4u << std::min(i, 13));
}

TEST_F(StringTest, ChangesItsText) {
  const std::tuple<Text, Change, Text> cases[] = {
      {"x", [](String& s) { s = String(kNull); }, ""},
      {"x", [](String& s) { s.Append("abc", 2), s.Append("d", 3); }, "xabd\0\0"s},
      {"abc", [](String& s) { s.Insert("x", 3), s.Delete(3, 1); }, "abc"},
      {"abc", [](String& s) { s.InsertChar(0, 1); }, "a\0b"s},
      {"abc", [](String& s) { s.SetPadChar('*'), s.At(3), s.At(7); }, "abc ****"},
      {"abc", [](String& s) { s.SetPadChar(0), s.SetAt(5, 'x'), s.SetAt(5000, 'x'); }, "abc"},
      {"abc", [](String& s) { s.Insert("123", 0), FailAllocation(1), s.SetAt(6, 'x'); }, "123abc"},
      {"\t  a b  \t", [](String& s) { s.Trim(); }, "a b"},
      {" \ta \xE9", [](String& s) { s.Trim(); }, "a \xE9"},
      {"a \t b  ", [](String& s) { s.CollapseBlanks(); }, "a b "},
      {"a\tb\xE9z", [](String& s) { s.RemoveControlChars(); }, "abz"},
      {"abca", [](String& s) { s.XorChars('a'), s.AddToChars(0xFF); }, "`\2\1`"},
      {"x", [](String& s) { s.FromLatin1ToUtf8("\xE9z\x80\xFF", 3); }, "\xC3\xA9z\xC2\x80"},
      {"aa", [](String& s) { s.ReplaceAll("a", kLong.c_str()); }, kLong + kLong},
      {"abcd", [](String& s) { s = s.Mid(1, UINT_MAX) + s.MidFrom(3).Text(); }, "bcdd"},
      {"%s", [](String& s) { s.Format(s.Text(), kLong.c_str()); }, "%s...."},
      {"", [](String& s) { s.Format("%.4095s", kLong.c_str()); }, kLong.substr(0, 4095)},
      {"", [](String& s) { s.Format("%.4096s", kLong.c_str()); }, "%.4096s...."},
      {"", [](String& s) { s.Format(kLong.c_str(), 0); }, kLong.substr(0, 4086) + "...."},
  };
  for (const auto& [start, change, result] : cases) {
    String string(start.c_str());
    change(string);
    EXPECT_EQ(Text(string.Text(), string.Length() + 1), result + '\0') << "from " << start;
  }
  String string("abc");
  memset(&string.At(0), '#', 8);
  string = "a", string.Append("b");
  EXPECT_EQ(Text(string.Text(), 6), "ab\0\0\0#"s) << "zero bytes behind an appended text";
}

TEST_F(StringTest, ComparesAndSearches) {
  const String banana("banana"), upper("ABC"), high("a\xE9");
  EXPECT_TRUE(banana.FindReverse("a", 0, true) == 5 && banana.FindReverse("a", 6, true) == -1);
  EXPECT_TRUE(banana.FindReverse("ANA", 1, false) == 3 && banana.EndsWith("NA", false));
  EXPECT_TRUE(high.Hash(1000003, false) == 97 * 4 - 23 * 2 && upper.Hash(9973, false) == 1366);
  EXPECT_TRUE(high.Compare(&banana, true, false) == -1 && high.Compare(&upper, true, false) == 1);
  EXPECT_TRUE(String("abcd").Compare(&upper, 0, 1) == 0);
  EXPECT_TRUE(upper.Equals("abc", false) && !upper.Equals("abc", true) && !upper.Equals("AB", 1));
  EXPECT_TRUE(String(" \tx").FirstNonBlank(2) == 2 && String(" \tx").FirstNonBlank(1) == -1);
  EXPECT_TRUE(upper.IsAlpha() && !String().IsAlpha() && high.HasHighBit() && !upper.HasHighBit());
}

TEST_F(StringTest, CollapsesThroughTheDeleteSlot) {
  struct Keeper : String {
    using String::String;
    void Delete(int, u32) override { ++deletions; }
    int deletions = 0;
  } keeper("a   b");
  keeper.CollapseBlanks();
  EXPECT_EQ(keeper.deletions, 2);
}

TEST_F(StringTest, RefusesMisuseAndHugeSizes) {
  const std::pair<int, Change> cases[] = {
      {1, [](String& s) { s.Append("x", -2); }},
      {1, [](String& s) { s.Reserve(0); }},
      {1, [](String& s) { EXPECT_TRUE(s.SetAt(-1, 'x') != 'x' && s.At(0) == 'a'); }},
      {1, [](String& s) { EXPECT_EQ(s.Compare(nullptr, true, false), 1); }},
      {1, [](String& s) { s.SubtractFromChars('b'), s.AddToChars('b'); }},
      {0, [](String& s) { s.Append("x", INT_MAX), s.SetAt(INT_MAX, 'x'); }},
      {0, [](String& s) { s.FromLatin1ToUtf8("x", INT_MAX), s.Reserve(UINT_MAX); }},
      {0,
       [](String& s) { EXPECT_TRUE(!s.Reserve(UINT_MAX - 9) && !s.EmptyReserve(UINT_MAX - 9)); }},
      {0,
       [](String&) {
         EXPECT_EQ(String("x", UINT_MAX).Length() + String('x', UINT_MAX - 5).Length(), 0u);
       }},
  };
  for (const auto& [reported, change] : cases) {
    String string("abc");
    change(string);
    EXPECT_EQ(State(string), State(String("abc")));
    EXPECT_EQ(TakeReports("\"cString\" ("), reported);
  }
}

// --- Random operations compared with std::string -------------------------------------------------

static Text Cut(const Text& text) { return text.c_str(); }  // at its first NUL

static bool Replace(Text& text, size_t& from, const Text& needle, const Text& with) {
  const size_t at = Text(text.c_str() + from).find(needle);
  if (at == Text::npos) return false;
  text = Cut(text.replace(from + at, needle.size(), with));
  from += at + with.size();
  return true;
}

TEST_F(StringTest, BehavesAsAPlainTextAndStaysAsItWasWithoutMemory) {
  Text model, word, given, other;
  const char* argument = nullptr;  // an own text, or one that stands in the string itself
  char ch = 0;
  int pos = 0;
  size_t at = 0, size = 0, start = 0;  // `at` is the position, unsigned
  u32 count = 0;
  bool inside = false;  // at a character, or at 0
  FailAllocation(1);    // even the first block is missing
  String real("abc");
  bool agrees = true;  // the operation's result
  const std::function<void()> operations[] = {
      [&] { real.Assign(argument), model = given; },
      [&] { real.AppendChar(ch), model += ch; },
      [&] { real.Append(argument), model += given; },
      [&] {
        real.InsertChar(ch, pos);
        if (at <= size) model.insert(at, 1, ch), model.resize(size + (ch != 0));
      },
      [&] {
        real.Insert(argument, pos);
        if (inside && !given.empty()) model = Cut(model.insert(at, given));
      },
      [&] {
        real.Delete(pos, count);
        if (inside) model = Cut(model.erase(at, count));
      },
      [&] { agrees = Bytes(real.Mid(pos, count)) == (inside ? Cut(model.substr(at, count)) : ""); },
      [&] {
        agrees = real.ReplaceFirstWithChar(argument, ch, static_cast<u32>(pos));
        agrees = agrees == (at < size && !given.empty() && Replace(model, at, given, Text(1, ch)));
      },
      [&] {
        const bool tried = size && given != other;
        if (tried) model = Cut(model);
        agrees = real.Substitute(argument, other.c_str()) ==
                 (tried && Replace(model, start, given, other));
      },
      [&] {
        u32 replaced = 0;
        if (!given.empty()) model = Cut(model);
        while (!given.empty() && Replace(model, start, given, other)) ++replaced;
        agrees = real.ReplaceAll(argument, other.c_str()) == replaced;
      },
      [&] {
        real.SetAt(pos, ch);
        if (pos < 0 || pos == INT_MAX) return;
        if (at >= size) model.resize(at + 1, ' ');
        model[at] = ch;
      },
      [&] { real.Format("%s|%s", argument, real.Text()), model = given + "|" + Cut(model); },
      [&] { agrees = real.Reserve(count % 60 + 1) && Bytes(String(real)) == model; },
      [&] { real.FromLatin1ToUtf8(argument), model = Bytes(real); },
      [&] { real.Trim(), real.CollapseBlanks(), model = Bytes(real); },
  };
  for (int step = 0; step < 600000 && !HasFailure(); ++step) {
    if (model.size() > 400) real = kNull, model.clear();
    const Text before = model;
    size = model.size(), word = Word(12), other = Word(4), ch = "a \xE9"[Below(4)], start = 0;
    argument = Below(3) ? word.c_str() : real.Text() + Below(size + 1);
    given = argument, count = Below(8) ? Below(6) : UINT_MAX;
    pos = Position(size), at = static_cast<u32>(pos), inside = at < size || pos == 0;
    const u32 operation = Below(std::size(operations));
    FailAllocation(Below(9) ? 0 : 1);
    agrees = true, operations[operation]();
    const bool failed = FailAllocation(0);
    if (failed && Bytes(real) == before) model = before;
    EXPECT_TRUE(agrees || failed) << "step " << step << ", operation " << operation;
    EXPECT_EQ(Bytes(real), model) << "step " << step << ", operation " << operation;
    EXPECT_TRUE(real.Length() < real.Capacity() && real.Text()[real.Length()] == 0) << operation;
  }
  FailAllocation(1);
  EXPECT_STREQ(String("abc").Text(), "") << "the block that stands in for a missing one is changed";
}
