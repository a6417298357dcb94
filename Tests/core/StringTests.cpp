// SPDX-License-Identifier: MIT
#include "TestSupport.h"

using StringTest = CoreTest;
using Change = void (*)(String&);

static const Text kLong(5000, 'x');
static const char* const kNull = nullptr;

// As a host could leave it.
static void SetCapacity(String& s, u32 capacity) {
  *reinterpret_cast<u32*>(reinterpret_cast<char*>(&s) + 16) = capacity;
}

// Of the result, a capacity of 0 is not looked at.
struct Case {
  Text start;
  Change change;
  Text text;
  u32 capacity = 0, growBy = 0, reports = 0;
};

TEST_F(StringTest, ChangesAndGrowsByItsPolicy) {
  const Case cases[] = {
      {"", [](String& s) { s.Reserve(10); }, "", 15, 8},
      {"", [](String& s) { s.Reserve(1019), s.Reserve(2000); }, "", 2009, 16},
      {"", [](String& s) { s.Reserve(1020), s.Reserve(2000); }, "", 2009 * 13 / 10, 16},
      {"abc", [](String& s) { s = "1234567"; }, "1234567", 8, 4},
      {"abc", [](String& s) { s = "12345678"; }, "12345678", 13, 4},
      {"abc", [](String& s) { s = "1234567", s.Reserve(4); }, "1234567", 9, 8},
      {"abc", [](String& s) { s = "1234567", s.Append("x", 0), s.Append(kNull); }, "1234567", 8, 4},
      {"abc", [](String& s) { s.EmptyReserve(3), s.EmptyReserve(4); }, "", 9, 4},
      {"abc", [](String& s) { s.Append("d"); }, "abcd", 15, 8},
      {"abc", [](String& s) { s.Insert("123", 0), s.InsertChar('x', 0); }, "x123abc", 15, 8},
      {"abcdefg", [](String& s) { s = "a", s = s.MidFrom(2); }, ""},
      {"abc", [](String& s) { s = s.MidFrom(0) + s.MidFrom(-1).Text(); }, "abc"},
      {"abc", [](String& s) { s = "12345", s.AppendChar('x'); }, "12345x", 8, 4},
      {"abc", [](String& s) { s = "12345", s.InsertChar('x', 0); }, "x12345", 8, 4},
      {"abc", [](String& s) { s.Insert("12345", 0); }, "12345abc", 19, 8},
      {"abc", [](String& s) { s.Insert("123", 0), FailAllocation(1), s.SetAt(6, 'x'); }, "123abc"},
      {"abc", [](String& s) { s.Format("%04d", 1); }, "0001", 10, 4},
      {"abc", [](String& s) { s.SetPadChar('*'), s.At(3), s.At(7); }, "abc ****"},
      {"abc", [](String& s) { s.ReplaceAll("b", "x"); }, "axc", 13, 16},
      {"abc", [](String& s) { s.SetPadChar(0), s.SetAt(5, 'x'), s.SetAt(5000, 'x'); }, "abc"},
      {"x", [](String& s) { s = String(kNull), s.Append("d", 3), s.Append("abc", 2); }, "d\0\0ab"s},
      {"\t  a b \xE9 \t", [](String& s) { s.Trim(); }, "a b \xE9"},
      {" \ta ", [](String& s) { s.CollapseBlanks(); }, " a "},
      {"\1a\2\1b", [](String& s) { s.RemoveControlChars(); }, "ab"},
      {"a \t b  \xE9\1", [](String& s) { s.CollapseBlanks(), s.RemoveControlChars(); }, "a b "},
      {"bbca", [](String& s) { s.XorChars('a'), s.AddToChars(0xFF); }, "\2\2\1`"},
      {"x", [](String& s) { s.FromLatin1ToUtf8("\xE9\x7F\x80\xFF", 3); }, "\xC3\xA9\x7F\xC2\x80",
       35, 4},
      {"abcd", [](String& s) { s = s.Mid(1, UINT_MAX) + s.MidFrom(3).Text(); }, "bcdd"},
      {"abc", [](String& s) { s.Format("%s", ""); }, "", 8, 4},
      {"abc", [](String& s) { s.Format(kNull, 0); }, "...."},
      {"%s", [](String& s) { s.Format(s.Text(), kLong.c_str()); }, "%s...."},
      {"", [](String& s) { s.Format("%.4095s", kLong.c_str()); }, kLong.substr(0, 4095)},
      {"", [](String& s) { s.Format("%.4096s", kLong.c_str()); }, "%.4096s...."},
      {"", [](String& s) { s.Format(kLong.c_str(), 0); }, kLong.substr(0, 4086) + "...."},
      {"x", [](String& s) { s.FromLatin1ToUtf8("x", -2); }, ""},
      {"abc", [](String& s) { s.Append("x", -2), s.SetAt(-1, s.Reserve(0)); }, "abc", 8, 4, 3},
      {"abc", [](String& s) { SetCapacity(s, 3), s.Append("x"), s.AppendChar('x'); }, "abc", 3, 4,
       2},
      {"abc", [](String& s) { EXPECT_EQ(s.Compare(nullptr, true, false), 1); }, "abc", 8, 4, 1},
      {"abc", [](String& s) { s.SubtractFromChars('b'), s.AddToChars('b'); }, "abc", 8, 4, 1},
      {"\x81", [](String& s) { s.SubtractFromChars(1); }, "\x80", 6, 4, 1},
      {"\x80", [](String& s) { s.SubtractFromChars(1); }, "\x7F", 6, 4},
      {"abc", [](String& s) { s.Append("x", INT_MAX), s.SetAt(INT_MAX, 'x'); }, "abc", 8, 4},
      {"abc", [](String& s) { s.FromLatin1ToUtf8("x", INT_MAX), s.Reserve(UINT_MAX); }, "abc", 8,
       4},
      {"abc", [](String& s) { s.Reserve(UINT_MAX - 9), s.EmptyReserve(UINT_MAX - 9); }, "abc", 8,
       4},
      {"abc", [](String& s) { s = String("x", UINT_MAX) + String('x', UINT_MAX - 5).Text(); }, ""},
      // A null argument is an empty text or changes nothing.
      {"abc", [](String& s) { s.Assign(kNull); }, ""},
      {"abc", [](String& s) { s = kNull; }, ""},
      {"abc",
       [](String& s) {
         s.Append(kNull), s.Append(kNull, 0), s.Insert(kNull, 0);
         EXPECT_FALSE(s.Equals(kNull, true) || s.EndsWith(kNull, true));
         EXPECT_FALSE(s.ReplaceFirstWithChar(kNull, 'x', 0) || s.Substitute(kNull, "x"));
         EXPECT_FALSE(s.Substitute("a", kNull) || s.ReplaceAll(kNull, "x"));
         EXPECT_TRUE(s.ReplaceAll("a", kNull) == 0 && s.FindReverse(kNull, 0, true) == -1);
       },
       "abc"},
      {"abc", [](String& s) { s.FromLatin1ToUtf8(kNull), s.Append("x"); }, "x"},
      {"abc", [](String& s) { s.FromLatin1ToUtf8(kNull, 7), s.Append("x"); }, "x"},
      {"abc", [](String& s) { s = String(kNull, 5) + kNull; }, ""},
      {"", [](String& s) { EXPECT_FALSE(s.Equals(kNull, true)); }, ""},
  };
  for (const auto& [start, change, text, capacity, growBy, reports] : cases) {
    String string(start.c_str());
    change(string);
    EXPECT_EQ(Text(string.Text(), string.Length() + 1), text + '\0') << "from " << start;
    if (capacity) EXPECT_TRUE(string.Capacity() == capacity && string.GrowBy() == growBy) << text;
    EXPECT_EQ(static_cast<u32>(TakeReports("\"cString\" (")), reports);
  }
  String large('x', 1995), all('b', 40000), string("abc");
  for (u32 n = 3000; n < 3010; ++n) {
    String grown(large);
    EXPECT_TRUE(grown.Reserve(n) && grown.Capacity() == (n + 5) * 13 / 10) << "above a kilobyte";
  }
  EXPECT_TRUE(all.ReplaceAll("b", "x") == 40000 && all.Capacity() == (80001 + 5) * 13 / 10);
  memset(&string.At(0), '#', 8);
  string = "a", string.Append("b");
  EXPECT_EQ(Text(string.Text(), 6), "ab\0\0\0#"s) << "zero bytes after an appended text";
  memset(&large.At(0), '#', 8);
  large.FromLatin1ToUtf8("a");
  EXPECT_EQ(Text(large.Text(), 4), "a\0\0#"s) << "zero bytes after a converted text";
  EXPECT_TRUE(AddSizes(UINT_MAX - 1, 1) == UINT_MAX && AddSizes(UINT_MAX, 2) == UINT_MAX);
  EXPECT_TRUE(MultiplySizes(INT_MAX, 2) == UINT_MAX - 1 && MultiplySizes(3, 1u << 31) == UINT_MAX);
  EXPECT_EQ(MultiplySizes(3, 0), 0u);
  for (int i = 0; i < 15; ++i, string.Reserve(1)) EXPECT_EQ(string.GrowBy(), 4u << std::min(i, 13));
  EXPECT_TRUE(string.Reserve(string.Capacity()) && Text(string.Text(), 5) == "ab\0\0\0"s);
}

TEST_F(StringTest, ComparesAndSearches) {
  static int deletions = 0;
  struct Keeper : String {
    void Delete(int, u32) override { ++deletions; }
  } keeper;
  keeper.Assign("a   b\1"), keeper.CollapseBlanks(), keeper.RemoveControlChars();
  EXPECT_EQ(deletions, 3) << "characters are deleted through the slot";
  const String banana("banana"), upper("ABC"), high("a\xE9");
  EXPECT_TRUE(banana.CountChar('b') == 1 && banana.CountChar('a') == 3);
  EXPECT_TRUE(banana.FindReverse("ANA", 3, false) == 3 && banana.FindReverse("a", 6, true) == -1);
  const String more("ABCD");
  EXPECT_TRUE(upper.Compare(&upper, true, false) == 0 && more.Compare(&upper, true, true) == 0);
  EXPECT_TRUE(more.Compare(&upper, true, false) == 1 && upper.Compare(&more, true, true) == -1);
  EXPECT_TRUE(String("abc").SetAt(-1, 'x') == 0 && String("abc").SetAt(-1, 'x') == 0);
  EXPECT_TRUE(upper.FindReverse("ABCD", 0, true) == -1 && upper.FindReverse("", 0, true) == -1);
  EXPECT_TRUE(upper.FindReverse("A", -1, true) == -1 && upper.FindReverse("ABC", 0, true) == 0);
  EXPECT_TRUE(high.Hash(1000003, false) == 97 * 4 - 23 * 2 && upper.Hash(9973, false) == 1366);
  EXPECT_TRUE(high.Compare(&upper, true, false) == 1 && String("abcd").Compare(&upper, 0, 1) == 0);
  EXPECT_TRUE(upper.EndsWith("bc", false) && !upper.EndsWith("xc", false) &&
              !upper.Equals("abc", true) && !upper.Equals("AB", 1));
  EXPECT_TRUE(String(" \tx").FirstNonBlank(2) == 2 && String(" \tx").FirstNonBlank(1) == -1 &&
              String("x").FirstNonBlank(0) == 0);
  EXPECT_TRUE(String('\0', 3).IsEmpty() && String('x', 3).Equals("xxx", true));
  EXPECT_TRUE(upper.IsAlpha() && !String().IsAlpha() && !String("1a").IsAlpha());
  EXPECT_TRUE(!String("a1").IsAlpha() && String("\x80").HasHighBit() && high.HasHighBit() &&
              !upper.HasHighBit());
}
