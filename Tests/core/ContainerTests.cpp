// SPDX-License-Identifier: MIT
#include <functional>

#include "TestSupport.h"
#include "cLib/StringDZ.h"
#include "cLib/StringTokenizer.h"
#include "cLib/cFilo.h"
#include "cLib/cHashTable.h"

using ArrayTest = CoreTest;
using FifoTest = CoreTest;
using HashTableTest = CoreTest;
using StringDZTest = CoreTest;

TEST_F(ArrayTest, GrowsByAFifthMoreThanTheIndex) {
  Array<Element> array;
  for (const auto& [index, capacity] : {std::pair(49, 50u), {50, 110u}, {114, 246u}}) {
    EXPECT_EQ(array.SetAt(new Element, index), index);
    EXPECT_EQ(array.Capacity(), capacity);
  }
}

TEST_F(ArrayTest, DoesNotDeleteWhatItDoesNotOwn) {
  Element first, second;
  Array<Element> array;
  array.SetOwnsElements(false);
  array.SetAt(&first, 3), array.SetAt(&second, 3);
  EXPECT_EQ(TakeReports("Memory leak deteched"), 1);
  array.Clear();
  array.SetAt(&first, 3);
  EXPECT_EQ(TakeReports(), 0);
}

TEST_F(ArrayTest, ReportsAndChangesNothing) {
  Array<Element> array;
  array.SetAt(new Element, 0);
  const std::function<bool()> broken[] = {
      [&] { return array.SetAt(nullptr, -1) == -1; },
      [&] { return array.SetAt(nullptr, INT_MAX) == -1; },
      [&] { return !array.Detach(1) && array.Count() == 1; },
      [&] { return !array.Detach(-1); },
      [&] { return array.Grow(0), true; },
      [&] { return array.Grow(INT_MAX), true; },
      [&] { return FailAllocation(1), array.Grow(1), true; },
  };
  for (const auto& operation : broken) {
    EXPECT_TRUE(operation() && array.Count() == 1 && array.Capacity() == 50);
    EXPECT_EQ(TakeReports("\"cArray\" ("), 1) << &operation - broken;
  }
  FailAllocation(1);
  Array<Element> late;  // made without memory
  EXPECT_EQ(TakeReports(), 1);
  EXPECT_EQ(late.SetAt(new Element, 0), 0);
}

TEST_F(ArrayTest, ListsAndStacksKeepTheirOrder) {
  List<Element> list;
  Stack<Element> stack;
  ListIter<Element> cursor(list);
  EXPECT_TRUE(!cursor.First() && !stack.Pop() && !stack.Top());
  for (int i = 0; i < 60; ++i) list.SetAt(new Element(i), i), stack.Push(new Element(i));
  int expected = 0;
  for (Element* e = cursor.First(); e; e = cursor.Next()) EXPECT_EQ(e->id, expected++);
  EXPECT_TRUE(expected == 60 && !cursor.Current() && !cursor.Next());
  while (stack.Depth() > 30) {
    EXPECT_EQ(stack.Top()->id, --expected);
    delete stack.Pop();
  }
  stack.Push(new Element);
  EXPECT_EQ(Element::live, 91);
  stack.Clear();
  EXPECT_EQ(Element::live, 60);
}

TEST_F(FifoTest, ReportsLeaksAndMissingSlots) {
  Element element, *none = nullptr;
  FIFO<Element> fifo(1);
  fifo.SetOwnsElements(false);
  fifo.Push(&element), fifo.Push(&element), fifo.SetAt(none, 0), fifo.Push(&element);
  EXPECT_EQ(TakeReports(), 0);
  fifo.Push(none);
  EXPECT_EQ(TakeReports("Memory leak deteched"), 1);
  for (const i32 size : {0, -1, INT_MAX}) {
    FIFO<Element> broken(size);
    EXPECT_FALSE(broken.Push(&element));
    EXPECT_EQ(TakeReports("\"cFilo\" ("), 1);
  }
  fifo.RemoveAt(1), fifo.SetAt(none, -1), fifo.Push(none);
  EXPECT_EQ(TakeReports("\"cFilo\" ("), 3);
}

TEST_F(HashTableTest, HashesAsLookup3) {
  const char text[] = "Four score and seven years ago";
  EXPECT_EQ(HashBytes("", 0, 0xDEADBEEF, false), 0xBD5B7DDEu);
  EXPECT_EQ(HashBytes(text, 30, 0, false), 0x17770551u);
  EXPECT_EQ(HashBytes(text, 30, 1, false), 0xCD628161u);
}

TEST_F(HashTableTest, WalksWhileEntriesAreRemovedAndDeletesWhatItOwns) {
  static cHashTable<Element>* walked;
  cHashTable<Element> table;
  walked = &table;
  for (int i = 0; i < 1000; ++i)
    table.Insert(std::to_string(i).c_str(), reinterpret_cast<uintptr_t>(new Element(i)));
  table.Walk([](const char* key, u32 value) {
    if (EXPECT_EQ(std::to_string(reinterpret_cast<Element*>(value)->id), key); value % 2) return;
    if (key[0] < '5') delete reinterpret_cast<Element*>(walked->Remove(key));
  });
  EXPECT_EQ(static_cast<int>(table.EntryCount()), Element::live);
  EXPECT_LT(Element::live, 600);
  table.Clear();
  EXPECT_EQ(static_cast<int>(table.EntryCount()), Element::live);
  table.Insert(nullptr, reinterpret_cast<uintptr_t>(new Element));
  EXPECT_NE(table.Find(""), 0u);
}

TEST_F(HashTableTest, TakesNoEntryWithoutMemory) {
  cHashTable<Element> table;
  for (const int n : {1, 2}) {
    FailAllocation(n);
    EXPECT_TRUE(table.Insert("key", 1) == 0 && table.EntryCount() == 0);
  }
  FailAllocation(1);
  cHashTable<Element> none;
  EXPECT_EQ(none.Insert("key", 1) + none.Find("key") + none.Remove("key"), 0u);
}

TEST_F(StringDZTest, NumbersAndJoinsItsEntries) {
  StringDZ list;
  EXPECT_EQ(Text(list.Joined(), 2), "\0\0"s);
  const Text longText(5000, 'y');
  list.Add("x", true), list.Add("", true), list.AddList("a=b=c\0d\0"),
      list.Add(longText.c_str(), true);
  EXPECT_STREQ(list.Value(0), "x");
  EXPECT_STREQ(list.Value(1), "b=c");
  EXPECT_EQ(list.Value(2), nullptr);
  const Text joined = "0=x\0a=b=c\0d\0"s + "3=" + longText + "\0\0"s;
  FailAllocation(1);
  EXPECT_EQ(Text(list.Joined(), 2), "\0\0"s);
  EXPECT_EQ(Text(list.Joined(), joined.size()), joined);
  EXPECT_EQ(TakeReports(), 0);
  list.Add(nullptr, false), list.AddList(nullptr), list.Value(-1), list.Value(4);
  EXPECT_EQ(TakeReports("\"cString\" ("), 4);
}

TEST(StringTokenizer, CutsAtDelimiters) {
  const struct {
    const char *text, *delimiters;
    char quote;
    bool keepEmpty;
    Text tokens;  // each with a bar behind it
    char last;
  } cases[] = {
      {",a,,b,", ",", 0, true, "|a||b||", ','},
      {",a,;b,", ",;", 0, false, "a|b|", ','},
      {"a;b", ",;", 0, true, "a|b|", ';'},
      {"", ",", 0, true, "|", 0},
      {",;", ",;", 0, false, "", ';'},
      {"a,b", "", 0, false, "a,b|", 0},
      {"x'a,'y,'it''s'", ",", '\'', true, "xa,y|it's|", ','},
      {"'',a", ",", '\'', false, "|a|", ','},
      {"'a,b", ",", '\'', true, "a,b|", 0},
      {"a\xFF\xE9z", "\xFF\xE9", 0, true, "a||z|", '\xE9'},
  };
  for (const auto& test : cases) {
    StringTokenizer tokenizer(test.text, test.delimiters);
    tokenizer.SetQuote(test.quote);
    Text tokens;
    while (tokenizer.NextToken(test.keepEmpty)) tokens += Bytes(tokenizer.Token()) + "|";
    EXPECT_EQ(tokens, test.tokens) << test.text;
    EXPECT_EQ(tokenizer.LastDelimiter(), test.last) << test.text;
  }
  StringTokenizer one("a b", ' '), two("ab", ",;");
  EXPECT_TRUE(one.NextToken(false) && one.FoundDelimiter() && !one.HasManyDelimiters());
  EXPECT_TRUE(one.NextToken(false) && !one.FoundDelimiter() && two.HasManyDelimiters());
}
