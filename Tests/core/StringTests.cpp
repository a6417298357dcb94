// SPDX-License-Identifier: MIT
#include <gtest/gtest.h>
#include <limits.h>
#include <string.h>

#include <functional>

#include "TestSupport.h"

using namespace std::string_literals;
using Operation = std::function<void(String&)>;

static const std::string kLong(5000, 'x');

TEST(String, ConstructorsTakeFiveBytesBeyondTheText) {
  const String padded("ab", 5);
  const struct {
    String string;
    std::string bytes;
  } cases[] = {{String(), ""},          {String(No()), ""},          {String("abc"), "abc"},
               {padded, "ab\0\0\0"s},   {String("abcdef", 2), "ab"}, {String("abc", 0), ""},
               {String('x', 3), "xxx"}, {String('\0', 3), ""},       {String(No(), 4), ""}};
  for (const auto& [string, bytes] : cases) {
    EXPECT_EQ(Bytes(string), bytes);
    EXPECT_EQ(State(string), State(String(string)));
    EXPECT_EQ(string.Capacity(), bytes.size() + 5);
    EXPECT_EQ(string.GrowBy(), 4u);
    EXPECT_EQ(string.Text()[string.Length()], 0);
  }
  EXPECT_EQ(State(String('x')), std::tuple("x"s, 5u, 4u));
}

TEST(String, GrowsByItsPolicy) {
  const struct {
    const char* name;
    std::string start;
    Operation change;
    u32 capacity, growBy;
  } cases[] = {
      {"reserve", "", [](String& s) { s.Reserve(10); }, 15, 8},
      {"reserve that fits still doubles", "abc", [](String& s) { s.Reserve(3); }, 8, 8},
      {"reserve large", std::string(1995, 'x'), [](String& s) { s.Reserve(3000); }, 3906, 8},
      {"reserve at 1024", std::string(1019, 'x'), [](String& s) { s.Reserve(3000); }, 3005, 8},
      {"reserve nothing", "abc", [](String& s) { s.Reserve(0); }, 8, 4},
      {"assign that fits", "abc", [](String& s) { s.Assign("1234567"); }, 8, 4},
      {"assign", "abc", [](String& s) { s.Assign("12345678"); }, 13, 4},
      {"empty that fits", "abc", [](String& s) { s.EmptyReserve(3); }, 8, 4},
      {"empty", "abc", [](String& s) { s.EmptyReserve(4); }, 9, 4},
      {"append", "abc", [](String& s) { s.Append("d"); }, 15, 8},
      {"append of empty text", "abc", [](String& s) { s.Append(""); }, 8, 4},
      {"append characters", "abc", [](String& s) { s.Append("", 4); }, 18, 8},
      {"append char", "abc",
       [](String& s) {
         for (char c : {'1', '2', '3'}) s.AppendChar(c);
       },
       8, 4},
      {"append chars", "abc",
       [](String& s) {
         for (char c : {'1', '2', '3', '4'}) s.AppendChar(c);
       },
       14, 8},
      {"insert char", "abc",
       [](String& s) {
         for (int i : {0, 1, 2, 3}) s.InsertChar('x', i);
       },
       15, 8},
      {"insert that fits", "abc", [](String& s) { s.Insert("1234", 0); }, 8, 4},
      {"insert", "abc", [](String& s) { s.Insert("12345", 0); }, 19, 8},
      {"format", "abc", [](String& s) { s.Format("%04d", 1); }, 10, 4},
      {"at", "abc", [](String& s) { s.At(8); }, 29, 16},
      {"replace all", "abc", [](String& s) { s.ReplaceAll("b", "x"); }, 13, 16},
  };
  for (const auto& test : cases) {
    String string(test.start.c_str());
    test.change(string);
    EXPECT_EQ(string.Capacity(), test.capacity) << test.name;
    EXPECT_EQ(string.GrowBy(), test.growBy) << test.name;
  }
  String string;
  for (int i = 0; i < 14; ++i) {
    EXPECT_EQ(string.GrowBy(), i < 13 ? 4u << i : 32768u);
    string.Reserve(1);
  }
}

TEST(String, ChangesItsText) {
  const struct {
    std::string start;
    Operation change;
    std::string result;
  } cases[] = {
      {"abc", [](String& s) { s.Insert("x", 3); }, "abc"},
      {"", [](String& s) { s.Insert("x", 0); }, "x"},
      {"abcdef", [](String& s) { s.Delete(1, 0xFFFFFFFF); }, "a"},
      {"abcdef", [](String& s) { s.Delete(6, 1); }, "abcdef"},
      {"abc", [](String& s) { s.InsertChar(0, 1); }, "a\0b"s},
      {"abc",
       [](String& s) {
         s.SetPadChar('*');
         s.At(7);
       },
       "abc*****"},
      {"abc",
       [](String& s) {
         s.SetPadChar('*');
         s.At(3);
       },
       "abc "},
      {"abc",
       [](String& s) {
         s.SetPadChar(0);
         s.SetAt(5, 'x');
         s.SetAt(5000, 'x');
       },
       "abc"},
      {"\t  a b  \t", [](String& s) { s.Trim(); }, "a b"},
      {" \ta \xE9", [](String& s) { s.Trim(); }, "a \xE9"},
      {" \t \xE9 ", [](String& s) { s.Trim(); }, "\xE9"},
      {" \t ", [](String& s) { s.Trim(); }, ""},
      {"a \t b  ", [](String& s) { s.CollapseBlanks(); }, "a b "},
      {"a\tb\xE9"
       "c",
       [](String& s) { s.RemoveControlChars(); }, "abc"},
      {"abca", [](String& s) { s.XorChars('a'); },
       "a\x03\x02"
       "a"},
      {"a\xFF", [](String& s) { s.AddToChars(2); }, "c\x01"},
      {"abcabc", [](String& s) { EXPECT_TRUE(s.ReplaceFirstWithChar("bc", '-', 2)); }, "abca-"},
      {"abcabc", [](String& s) { EXPECT_TRUE(s.Substitute("bc", "12345")); }, "a12345abc"},
      {"abc", [](String& s) { EXPECT_FALSE(s.Substitute("b", "b")); }, "abc"},
      {"aaa", [](String& s) { EXPECT_EQ(s.ReplaceAll("a", "aa"), 3u); }, "aaaaaa"},
      {"aaa", [](String& s) { EXPECT_EQ(s.ReplaceAll("", "b"), 0u); }, "aaa"},
      {"aa", [](String& s) { s.ReplaceAll("a", kLong.c_str()); }, kLong + kLong},
      {"a", [](String& s) { s.FromLatin1ToUtf8("\xE9z\x80\xFF", 3); }, "\xC3\xA9z\xC2\x80"},
      {"ab", [](String& s) { s = s + s.Text(); }, "abab"},
      {"abcd", [](String& s) { s = s.Mid(1, 0xFFFFFFFF) + s.MidFrom(3).Text(); }, "bcdd"},
      {"x", [](String& s) { s.Format("%s,%s,%d", s.Text(), s.Text(), 7); }, "x,x,7"},
      {"%s", [](String& s) { s.Format(s.Text(), kLong.c_str()); }, "%s...."},
      {"", [](String& s) { s.Format("%s", kLong.substr(0, 4095).c_str()); }, kLong.substr(0, 4095)},
      {"", [](String& s) { s.Format("%s", kLong.substr(0, 4096).c_str()); }, "%s...."},
      {"", [](String& s) { s.Format(kLong.c_str(), 0); }, kLong.substr(0, 4086) + "...."},
      {"a", [](String& s) { s.FormatV(No(), {}); }, "...."},
  };
  for (const auto& test : cases) {
    String string(test.start.c_str());
    test.change(string);
    EXPECT_EQ(Bytes(string), test.result) << "from " << test.start;
    EXPECT_EQ(string.Text()[string.Length()], 0) << "from " << test.start;
  }
}

TEST(String, KeepsZeroBytesBehindAnAppendedText) {
  String string("abc", 3);
  memset(&string.At(3), '#', 4);  // in the room of the first block
  string.Delete(1, 9);
  string.Append("b");
  EXPECT_EQ(std::string(string.Text(), 5), "ab\0\0\0"s);
  string.Reserve(100);
  EXPECT_EQ(std::string(string.Text(), 5), "ab\0\0\0"s);
}

TEST(String, ComparesAndSearches) {
  const String banana("banana"), upper("ABC"), high("a\xE9");
  EXPECT_EQ(banana.FindReverse("a", 0, true), 5);
  EXPECT_EQ(banana.FindReverse("a", 6, true), -1);
  EXPECT_EQ(banana.FindReverse("ANA", 1, false), 3);
  EXPECT_EQ(banana.FindReverse("ana", 4, true), -1);
  EXPECT_EQ(upper.Hash(9973, false), String("abc").Hash(9973, true));
  EXPECT_EQ(high.Hash(1000003, false), (97u * 4 - 23 * 2) % 1000003);
  EXPECT_EQ(high.Compare(&banana, true, false), -1);
  EXPECT_EQ(high.Compare(&upper, true, false), 1);
  EXPECT_EQ(String("a\x7F").Compare(&high, true, false), -1);
  EXPECT_EQ(String("abcdef").Compare(&upper, false, true), 0);
  EXPECT_NE(String("abcdef").Compare(&upper, true, true), 0);
  EXPECT_TRUE(upper.Equals("abc", false) && !upper.Equals("abc", true) &&
              !upper.Equals("AB", true));
  EXPECT_TRUE(banana.EndsWith("NA", false) && !banana.EndsWith("", true) &&
              !upper.EndsWith("xABC", true));
  EXPECT_EQ(String(" \tx").FirstNonBlank(2), 2);
  EXPECT_EQ(String(" \tx").FirstNonBlank(1), -1);
  EXPECT_TRUE(upper.IsAlpha() && !String().IsAlpha() && !String("a1").IsAlpha());
  EXPECT_TRUE(high.HasHighBit() && !upper.HasHighBit());
}

TEST(String, ReportsBrokenPreconditionsAndGoesOn) {
  const Operation broken[] = {
      [](String& s) { s.Append("x", -2); },
      [](String& s) { s.Reserve(0); },
      [](String& s) {
        s.SetAt(-1, 'x');
        EXPECT_EQ(s.SetAt(0, 'a'), 'a');
      },
      [](String& s) { EXPECT_EQ(s.Compare(nullptr, true, false), 1); },
      [](String& s) {
        s.SubtractFromChars('b');
        s.AddToChars('b');
      },
  };
  Reports reports;
  for (const auto& operation : broken) {
    String string("abc");
    const auto before = State(string);
    operation(string);
    EXPECT_EQ(State(string), before);
    EXPECT_EQ(reports.Take("\"cString\" ("), 1) << &operation - broken;
  }
}

TEST(String, CollapsesThroughTheDeleteSlot) {
  struct Keeper : String {
    using String::String;
    void Delete(int, u32) override { ++deletions; }
    int deletions = 0;
  } keeper("a   b");
  keeper.CollapseBlanks();
  keeper.RemoveControlChars();
  EXPECT_EQ(keeper.deletions, 2);
  EXPECT_EQ(Bytes(keeper), "a   b");
}

TEST(String, StaysAsItWasWithoutMemory) {
  const Operation operations[] = {
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
  const auto run = [](const Operation& operation, int failing) {
    String string("abc");
    for (const char ch : {'b', 'b', 'b'})
      string.AppendChar(ch);  // now a character more needs a block
    FailAllocation(failing);
    operation(string);
    FailAllocation(0);
    return Bytes(string);
  };
  for (const auto& operation : operations) {
    const std::string done = run(operation, 0);
    int failures = 0;
    for (int n = 1; n < 10; ++n) {
      const std::string result = run(operation, n);
      // A failure that the operation can do without may pass.
      EXPECT_TRUE(result == "abcbbb" || result == done) << &operation - operations;
      failures += result == "abcbbb";
    }
    EXPECT_GT(failures, 0) << &operation - operations;
  }
  FailAllocation(0);
  for (const u32 huge : {0x7FFFFFFFu, 0xFFFFFFF0u, 0xFFFFFFFFu}) {
    String string("abc");
    const auto before = State(string);
    EXPECT_FALSE(string.Reserve(huge) || string.EmptyReserve(huge));
    string.Append("x", INT_MAX);
    string.SetAt(INT_MAX, 'x');
    string.FromLatin1ToUtf8("x", INT_MAX);
    EXPECT_EQ(State(string), before);
    EXPECT_TRUE(String('x', huge).IsEmpty() && String("x", huge).IsEmpty());
  }
}

TEST(String, MadeWithoutMemoryIsEmptyAndWorksLater) {
  for (int round = 0; round < 2; ++round) {
    FailAllocation(1);
    String string("abc");
    for (const char ch : {'x', '\0'}) {
      FailAllocation(1);
      string.AppendChar(ch);
      FailAllocation(1);
      string.SetAt(0, ch);
      FailAllocation(1);
      string.Format("%c", ch);
      EXPECT_STREQ(string.Text(), "");
    }
    FailAllocation(0);
    string.Trim();
    string.Append("later");
    EXPECT_EQ(Bytes(string), "later");
  }
}
