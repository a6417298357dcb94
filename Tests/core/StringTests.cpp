// SPDX-License-Identifier: MIT
#include "TestSupport.h"

using StringTest = CoreTest;
using Change = void (*)(String&);

static const Text kLong(5000, 'x');

static auto State(const String& s) {
  return std::tuple(Bytes(s), s.Capacity(), s.GrowBy());
}

TEST_F(StringTest, ConstructorsTakeFiveBytesBeyondTheText) {
  const String padded("ab", 5);
  const struct {
    String string;
    Text bytes;
  } cases[] = {{String(), ""},          {String(No()), ""},       {String("abc"), "abc"},
               {padded, "ab\0\0\0"s},   {String("abc", 2), "ab"}, {String('x'), "x"},
               {String('x', 3), "xxx"}, {String('\0', 3), ""},    {String(No(), 4), ""}};
  for (const auto& [string, bytes] : cases) {
    const u32 capacity = string.Text() == cases[5].string.Text() ? 5 : bytes.size() + 5;
    EXPECT_EQ(State(string), std::tuple(bytes, capacity, 4u));
  }
}

TEST_F(StringTest, GrowsByItsPolicy) {
  const struct {
    Text start;
    Change change;
    u32 capacity, growBy;
  } cases[] = {
      {"", [](String& s) { s.Reserve(10); }, 15, 8},
      {"abc", [](String& s) { s.Reserve(3); }, 8, 8},
      {"abc", [](String& s) { s.Reserve(0); }, 8, 4},
      {Text(1995, 'x'), [](String& s) { s.Reserve(3000); }, 3906, 8},
      {Text(1019, 'x'), [](String& s) { s.Reserve(3000); }, 3005, 8},
      {"abc", [](String& s) { s.Assign("1234567"); }, 8, 4},
      {"abc", [](String& s) { s.Assign("12345678"); }, 13, 4},
      {"abc", [](String& s) { s.EmptyReserve(3); }, 8, 4},
      {"abc", [](String& s) { s.EmptyReserve(4); }, 9, 4},
      {"abc", [](String& s) { s.Append("d"); }, 15, 8},
      {"abc", [](String& s) { s.Append(""); }, 8, 4},
      {"abc", [](String& s) { s.Append("", 4); }, 18, 8},
      {"abc", [](String& s) { s.At(5), s.AppendChar('x'); }, 23, 8},
      {"abc", [](String& s) { s.InsertChar('1', 0), s.InsertChar('2', 0); }, 8, 4},
      {"abc", [](String& s) { s.Insert("123", 0), s.InsertChar('x', 0); }, 15, 8},
      {"abc", [](String& s) { s.Insert("1234", 0), s.AppendChar('x'); }, 14, 8},
      {"abc", [](String& s) { s.Insert("12345", 0); }, 19, 8},
      {"abc", [](String& s) { s.Format("%04d", 1); }, 10, 4},
      {"abc", [](String& s) { s.At(8); }, 29, 16},
      {"abc", [](String& s) { s.ReplaceAll("b", "x"); }, 13, 16},
  };
  for (const auto& test : cases) {
    String string(test.start.c_str());
    test.change(string);
    EXPECT_EQ(string.Capacity(), test.capacity) << &test - cases;
    EXPECT_EQ(string.GrowBy(), test.growBy) << &test - cases;
  }
  String string;
  for (int i = 0; i < 14; ++i, string.Reserve(1))
    EXPECT_EQ(string.GrowBy(), i < 13 ? 4u << i : 32768u);
}

TEST_F(StringTest, ChangesItsText) {
  const struct {
    Text start;
    Change change;
    Text result;
  } cases[] = {
      {"abc", [](String& s) { s.Insert("x", 3); }, "abc"},
      {"", [](String& s) { s.Insert("x", 0); }, "x"},
      {"abcdef", [](String& s) { s.Delete(6, 1); }, "abcdef"},
      {"abc", [](String& s) { s.InsertChar(0, 1); }, "a\0b"s},
      {"abc", [](String& s) { s.SetPadChar('*'), s.At(7); }, "abc*****"},
      {"abc", [](String& s) { s.SetPadChar('*'), s.At(3); }, "abc "},
      {"abc", [](String& s) { s.SetPadChar(0), s.SetAt(5, 'x'), s.SetAt(5000, 'x'); }, "abc"},
      {"\t  a b  \t", [](String& s) { s.Trim(); }, "a b"},
      {" \ta \xE9", [](String& s) { s.Trim(); }, "a \xE9"},
      {" \t ", [](String& s) { s.Trim(); }, ""},
      {"a \t b  ", [](String& s) { s.CollapseBlanks(); }, "a b "},
      {"a\tb\xE9"
       "c",
       [](String& s) { s.RemoveControlChars(); }, "abc"},
      {"abca", [](String& s) { s.XorChars('a'); },
       "a\x03\x02"
       "a"},
      {"a\xFF", [](String& s) { s.AddToChars(2); }, "c\x01"},
      {"aaa", [](String& s) { EXPECT_EQ(s.ReplaceAll("a", "aa"), 3u); }, "aaaaaa"},
      {"aaa", [](String& s) { EXPECT_EQ(s.ReplaceAll("", "b"), 0u); }, "aaa"},
      {"aa", [](String& s) { s.ReplaceAll("a", kLong.c_str()); }, kLong + kLong},
      {"abcd", [](String& s) { s = s.Mid(1, UINT_MAX) + s.MidFrom(3).Text(); }, "bcdd"},
      {"%s", [](String& s) { s.Format(s.Text(), kLong.c_str()); }, "%s...."},
      {"", [](String& s) { s.Format("%.4095s", kLong.c_str()); }, kLong.substr(0, 4095)},
      {"", [](String& s) { s.Format("%.4096s", kLong.c_str()); }, "%.4096s...."},
      {"", [](String& s) { s.Format(kLong.c_str(), 0); }, kLong.substr(0, 4086) + "...."},
      {"a", [](String& s) { s.FormatV(No(), {}); }, "...."},
  };
  for (const auto& test : cases) {
    String string(test.start.c_str());
    test.change(string);
    EXPECT_EQ(Bytes(string), test.result) << &test - cases;
  }
  String string("abc");
  memset(&string.At(0), '#', 8);
  string.Assign("a"), string.Append("b");
  EXPECT_EQ(Text(string.Text(), 5), "ab\0\0#"s);
  string.Append("c"), string.Reserve(100);
  EXPECT_EQ(Text(string.Text(), 6), "abc\0\0\0"s);
}

TEST_F(StringTest, ComparesAndSearches) {
  const String banana("banana"), upper("ABC"), high("a\xE9");
  EXPECT_EQ(banana.FindReverse("a", 0, true), 5);
  EXPECT_EQ(banana.FindReverse("a", 6, true), -1);
  EXPECT_EQ(banana.FindReverse("ANA", 1, false), 3);
  EXPECT_EQ(banana.FindReverse("ana", 4, true), -1);
  EXPECT_EQ(upper.Hash(9973, false), String("abc").Hash(9973, true));
  EXPECT_EQ(high.Hash(1000003, false), 97u * 4 - 23 * 2);
  EXPECT_EQ(high.Compare(&banana, true, false), -1);
  EXPECT_EQ(high.Compare(&upper, true, false), 1);
  EXPECT_EQ(String("a\x7F").Compare(&high, true, false), -1);
  EXPECT_EQ(String("abcdef").Compare(&upper, false, true), 0);
  EXPECT_TRUE(upper.Equals("abc", false) && !upper.Equals("abc", true) &&
              !upper.Equals(No(), true));
  EXPECT_TRUE(banana.EndsWith("NA", false) && !banana.EndsWith("", true));
  EXPECT_TRUE(String(" \tx").FirstNonBlank(2) == 2 && String(" \tx").FirstNonBlank(1) == -1);
  EXPECT_TRUE(upper.IsAlpha() && !String().IsAlpha() && high.HasHighBit() && !upper.HasHighBit());
}

TEST_F(StringTest, ReportsBrokenPreconditionsAndGoesOn) {
  const Change broken[] = {
      [](String& s) { s.Append("x", -2); },
      [](String& s) { s.Reserve(0); },
      [](String& s) { EXPECT_TRUE(s.SetAt(-1, 'x') != 'x' && s.At(0) == 'a'); },
      [](String& s) { EXPECT_EQ(s.Compare(nullptr, true, false), 1); },
      [](String& s) { s.SubtractFromChars('b'), s.AddToChars('b'); },
  };
  for (const Change change : broken) {
    String string("abc");
    change(string);
    EXPECT_EQ(State(string), State(String("abc")));
    EXPECT_EQ(TakeReports("\"cString\" ("), 1);
  }
}

TEST_F(StringTest, CollapsesThroughTheDeleteSlot) {
  struct Keeper : String {
    using String::String;
    void Delete(int, u32) override { ++deletions; }
    int deletions = 0;
  } keeper("a   b");
  keeper.CollapseBlanks();
  keeper.RemoveControlChars();
  EXPECT_EQ(keeper.deletions, 2);
}

TEST_F(StringTest, StaysAsItWasWithoutMemory) {
  const Change changes[] = {
      [](String& s) { s.Assign(kLong.c_str()); },
      [](String& s) { s.Assign(s.Text() + 1); },
      [](String& s) { s.Append(s.Text()); },
      [](String& s) { s.AppendChar('x'); },
      [](String& s) { s.InsertChar('x', 0); },
      [](String& s) { s.Insert(kLong.c_str(), 1); },
      [](String& s) { s.SetAt(3000, 'x'); },
      [](String& s) { s.Format("%s%s", s.Text(), "12345678"); },
      [](String& s) { s.EmptyReserve(100); },
      [](String& s) { s.Substitute("c", kLong.c_str()); },
      [](String& s) { s.ReplaceAll("b", kLong.c_str()); },
      [](String& s) { s.FromLatin1ToUtf8(s.Text() + 1); },
  };
  const auto run = [](Change change, int failing) {
    String string("abc");
    string.Insert("bbb", 1);  // now one character more needs a block
    FailAllocation(failing);
    change(string);
    FailAllocation(0);
    return Bytes(string);
  };
  for (const Change& change : changes) {
    const Text before = "abbbbc", done = run(change, 0);
    EXPECT_EQ(run(change, 1), before) << &change - changes;
    for (int n = 2; n < 9; ++n)  // the operation may do without some of its blocks
      if (const Text result = run(change, n); result != done) EXPECT_EQ(result, before);
  }
  for (const u32 huge : {0x7FFFFFFFu, 0xFFFFFFF0u, 0xFFFFFFFFu}) {
    String string("abc");
    EXPECT_FALSE(string.Reserve(huge) || string.EmptyReserve(huge));
    string.Append("x", INT_MAX), string.SetAt(INT_MAX, 'x'), string.FromLatin1ToUtf8("x", INT_MAX);
    EXPECT_EQ(State(string), State(String("abc")));
    EXPECT_TRUE(String('x', huge).IsEmpty() && String("x", huge).IsEmpty());
  }
}

TEST_F(StringTest, MadeWithoutMemoryIsEmptyAndWorksLater) {
  const Change changes[] = {[](String& s) { s.AppendChar('x'); },
                            [](String& s) { s.SetAt(0, 'x'); },
                            [](String& s) { s.Format("%c", 'x'); }, [](String& s) { s.Trim(); }};
  for (const Change change : changes) {
    FailAllocation(1);
    String string("abc");
    FailAllocation(1);
    change(string);
    EXPECT_EQ(Bytes(string) + string.Text(), "");
    FailAllocation(0);
    string.Append("later");
    EXPECT_EQ(Bytes(string), "later");
  }
}
