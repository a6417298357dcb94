// SPDX-License-Identifier: MIT
#include <gtest/gtest.h>
#include <limits.h>

#include <functional>

#include "TestSupport.h"
#include "cLib/StringDZ.h"
#include "cLib/StringTokenizer.h"
#include "cLib/cFilo.h"
#include "cLib/cHashTable.h"

using namespace std::string_literals;

// Every test must delete what it made.
class Containers : public testing::Test {
 protected:
  ~Containers() override {
    EXPECT_EQ(Element::live, 0);
    FailAllocation(0);
  }
  Reports reports;
};

using ArrayTest = Containers;
using FifoTest = Containers;
using StackTest = Containers;
using HashTableTest = Containers;
using StringDZTest = Containers;

TEST_F(ArrayTest, GrowsByAFifthMoreThanTheIndex) {
  Array<Element> array;
  EXPECT_EQ(array.Capacity(), 50u);
  EXPECT_EQ(array.SetAt(new Element, 49), 49);
  EXPECT_EQ(array.Capacity(), 50u);
  array.SetAt(new Element, 50);
  EXPECT_EQ(array.Capacity(), 110u);
  array.SetAt(new Element, 114);
  EXPECT_EQ(array.Capacity(), 110u + 114 + 22);
  EXPECT_EQ(array.Count(), 115);
  EXPECT_EQ(array.At(48), nullptr);
  EXPECT_EQ(Element::live, 3);
}

TEST_F(ArrayTest, DeletesOnlyWhatItOwns) {
  for (const bool owns : {true, false}) {
    Array<Element> array;
    array.SetOwnsElements(owns);
    Element* elements[] = {new Element, new Element};
    for (Element* element : elements) array.SetAt(element, 3);
    EXPECT_EQ(reports.Take("Memory leak deteched"), owns ? 0 : 1);
    EXPECT_EQ(Element::live, owns ? 1 : 2);
    array.Clear();
    EXPECT_EQ(array.Count(), 0);
    EXPECT_EQ(Element::live, owns ? 0 : 2);
    if (owns) continue;
    for (Element* element : elements) delete element;
  }
}

TEST_F(ArrayTest, ReportsAndChangesNothing) {
  Array<Element> array;
  Element element;
  array.SetOwnsElements(false);
  array.SetAt(&element, 0);
  const std::function<void()> broken[] = {[&] { EXPECT_EQ(array.SetAt(&element, -1), -1); },
                                          [&] { EXPECT_EQ(array.Detach(1), nullptr); },
                                          [&] { EXPECT_EQ(array.Detach(-1), nullptr); },
                                          [&] { array.Grow(0); },
                                          [&] { EXPECT_EQ(array.SetAt(&element, INT_MAX), -1); },
                                          [&] { array.Grow(INT_MAX); },
                                          [&] {
                                            FailAllocation(1);
                                            array.Grow(1);
                                          }};
  for (const auto& operation : broken) {
    operation();
    EXPECT_EQ(reports.Take("\"cArray\" ("), 1) << &operation - broken;
    EXPECT_EQ(array.Count(), 1);
    EXPECT_EQ(array.Capacity(), 50u);
  }
  EXPECT_EQ(array.Detach(0), &element);
  EXPECT_EQ(array.Count(), 1);
  Array<Element> empty;
  FailAllocation(1);
  Array<Element> late;
  EXPECT_EQ(reports.Take(), 1);
  EXPECT_EQ(late.SetAt(new Element, 0), 0);
}

TEST_F(ArrayTest, ListIterStepsThroughAList) {
  List<Element> list;
  ListIter<Element> cursor(list);
  EXPECT_EQ(cursor.First(), nullptr);
  for (int i = 0; i < 3; ++i) list.SetAt(new Element(i), list.Count());
  int expected = 0;
  for (Element* e = cursor.First(); e; e = cursor.Next()) EXPECT_EQ(e->id, expected++);
  EXPECT_EQ(expected, 3);
  EXPECT_EQ(cursor.Current(), nullptr);
  EXPECT_EQ(cursor.Next(), nullptr);
}

static std::string Ids(const FIFO<Element>& fifo) {
  std::string ids;
  for (u32 i = 0; i < fifo.Size(); ++i) ids += fifo.At(i) ? std::to_string(fifo.At(i)->id) : "-";
  return ids;
}

TEST_F(FifoTest, KeepsTheNewestFirst) {
  FIFO<Element> fifo(3);
  for (int i = 1; i <= 4; ++i) fifo.Push(new Element(i));
  EXPECT_EQ(Ids(fifo), "432");
  EXPECT_EQ(Element::live, 3);
  fifo.Push(fifo.At(2));
  EXPECT_EQ(Ids(fifo), "243");
  fifo.RemoveAt(1);
  EXPECT_EQ(Ids(fifo), "23-");
  fifo.SetAt(new Element(5), 0);
  fifo.SetAt(fifo.At(0), 0);
  EXPECT_EQ(Ids(fifo), "53-");
  EXPECT_EQ(reports.Take(), 0);
  fifo.Push(nullptr);
  EXPECT_EQ(Ids(fifo), "-53");
  fifo.RemoveAt(3);
  EXPECT_FALSE(fifo.SetAt(nullptr, -1));
  EXPECT_EQ(reports.Take("\"cFilo\" ("), 3);
}

TEST_F(FifoTest, ReportsLeaksAndMissingSlots) {
  auto element = std::make_unique<Element>(1);
  FIFO<Element> fifo(1);
  fifo.SetOwnsElements(false);
  fifo.Push(element.get());
  fifo.SetAt(nullptr, 0);
  fifo.Push(element.get());
  EXPECT_EQ(reports.Take(), 0);
  Element* const none = nullptr;
  fifo.Push(none);
  EXPECT_EQ(reports.Take("Memory leak deteched"), 1);
  for (const i32 size : {0, -1, INT_MAX}) {
    FIFO<Element> broken(size);
    EXPECT_FALSE(broken.Push(element.get()));
    EXPECT_EQ(reports.Take("\"cFilo\" ("), 1);
  }
}

TEST_F(StackTest, GivesBackInReverse) {
  Stack<Element> stack;
  EXPECT_EQ(stack.Pop(), nullptr);
  EXPECT_EQ(stack.Top(), nullptr);
  for (int i = 0; i < 60; ++i) stack.Push(new Element(i));
  for (int i = 59; i >= 30; --i) {
    EXPECT_EQ(stack.Top()->id, i);
    delete stack.Pop();
  }
  stack.Push(new Element);
  EXPECT_EQ(stack.Depth(), 31);
  EXPECT_EQ(Element::live, 31);
  stack.Clear();
  EXPECT_EQ(Element::live, 0);
  EXPECT_EQ(stack.Top(), nullptr);
  EXPECT_EQ(reports.Take(), 0);
}

TEST_F(HashTableTest, HashesAsLookup3) {
  const char text[] = "Four score and seven years ago";
  EXPECT_EQ(HashBytes("", 0, 0, false), 0xDEADBEEFu);
  EXPECT_EQ(HashBytes("", 0, 0xDEADBEEF, false), 0xBD5B7DDEu);
  EXPECT_EQ(HashBytes(text, 30, 0, false), 0x17770551u);
  EXPECT_EQ(HashBytes(text, 30, 1, false), 0xCD628161u);
  EXPECT_EQ(HashBytes("KEY{", 4, 42, true), HashBytes("key{", 4, 42, false));
}

TEST_F(HashTableTest, FindsKeysWithoutRegardToCase) {
  cHashTable<Element> table;
  table.SetOwnsElements(false);
  EXPECT_EQ(table.Insert("Key", 7), 7u);
  EXPECT_EQ(table.Find("KEY"), 7u);
  EXPECT_EQ(table.Insert("key", 8), 7u);
  EXPECT_EQ(table.EntryCount(), 1u);
  EXPECT_EQ(table.RemoveIfValue("kEY", 7), 0u);
  EXPECT_EQ(table.RemoveIfValue("kEY", 8), 8u);
  EXPECT_EQ(table.Insert(nullptr, 9), 9u);
  EXPECT_EQ(table.Find(""), 9u);
  EXPECT_EQ(table.Remove(nullptr), 9u);
  EXPECT_EQ(table.Remove(""), 0u);
  EXPECT_EQ(table.EntryCount(), 0u);
}

TEST_F(HashTableTest, WalksWhileEntriesAreRemovedAndDeletesWhatItOwns) {
  static cHashTable<Element>* walked;
  cHashTable<Element> table;
  walked = &table;
  for (int i = 0; i < 1000; ++i)
    table.Insert(std::to_string(i).c_str(), reinterpret_cast<uintptr_t>(new Element(i)));
  table.Walk([](const char* key, u32 value) {
    auto* element = reinterpret_cast<Element*>(value);
    EXPECT_EQ(std::to_string(element->id), key);
    if (element->id % 2) delete reinterpret_cast<Element*>(walked->Remove(key));
  });
  EXPECT_EQ(table.EntryCount(), 500u);
  EXPECT_EQ(Element::live, 500);
  table.Clear();
  EXPECT_EQ(table.EntryCount(), 0u);
  EXPECT_EQ(Element::live, 0);
  table.Insert("again", reinterpret_cast<uintptr_t>(new Element));
}

TEST_F(HashTableTest, TakesNoEntryWithoutMemory) {
  cHashTable<Element> table;
  for (const int n : {1, 2}) {
    FailAllocation(n);
    EXPECT_EQ(table.Insert("key", 1), 0u);
    EXPECT_EQ(table.EntryCount(), 0u);
  }
  FailAllocation(1);
  cHashTable<Element> none;
  EXPECT_EQ(none.Insert("key", 1), 0u);
  EXPECT_EQ(none.Find("key") + none.Remove("key"), 0u);
}

TEST_F(StringDZTest, NumbersAndJoinsItsEntries) {
  StringDZ list;
  EXPECT_EQ(std::string(list.Joined(), 2), "\0\0"s);
  const std::string longText(5000, 'y');
  list.Add("x", true);
  list.Add("", true);
  list.Add("no value", false);
  list.AddList("a=b=c\0d\0");
  list.Add(longText.c_str(), true);
  EXPECT_EQ(list.Count(), 5);
  EXPECT_STREQ(list.Value(0), "x");
  EXPECT_EQ(list.Value(1), nullptr);
  EXPECT_STREQ(list.Value(2), "b=c");
  EXPECT_EQ(list.Value(4), longText);
  const std::string joined = "0=x\0no value\0a=b=c\0d\0"s + "4=" + longText + "\0\0"s;
  EXPECT_EQ(std::string(list.Joined(), joined.size()), joined);
  FailAllocation(1);
  EXPECT_EQ(std::string(list.Joined(), 2), "\0\0"s);
  FailAllocation(0);
  EXPECT_EQ(std::string(list.Joined(), joined.size()), joined);
  EXPECT_EQ(reports.Take(), 0);
  list.Add(nullptr, false);
  list.AddList(nullptr);
  list.Value(-1);
  list.Value(5);
  EXPECT_EQ(reports.Take("\"cString\" ("), 4);
  list.Clear();
  EXPECT_EQ(list.Count(), 0);
}

TEST(StringTokenizer, CutsAtDelimiters) {
  const struct {
    const char* text;
    const char* delimiters;
    char quote;
    bool keepEmpty;
    std::string tokens;  // each with a bar behind it
    char last;
  } cases[] = {
      {",a,,b,", ",", 0, true, "|a||b||", ','},
      {",a,;b,", ",;", 0, false, "a|b|", ','},
      {"a;b", ",;", 0, true, "a|b|", ';'},
      {"", ",", 0, true, "|", 0},
      {"", ",", 0, false, "", 0},
      {",;", ",;", 0, false, "", ';'},
      {"a,b", "", 0, false, "a,b|", 0},
      {"'a,b',c", ",", '\'', false, "a,b|c|", ','},
      {"x'a,'y,'it''s'", ",", '\'', true, "xa,y|it's|", ','},
      {"'',a", ",", '\'', false, "|a|", ','},
      {"'a,b", ",", '\'', true, "a,b|", 0},
      {"'a,b", ",", 0, true, "'a|b|", ','},
      {"a\xFF\xE9z", "\xFF\xE9", 0, true, "a||z|", '\xE9'},
  };
  for (const auto& test : cases) {
    StringTokenizer tokenizer(test.text, test.delimiters);
    tokenizer.SetQuote(test.quote);
    std::string tokens;
    while (tokenizer.NextToken(test.keepEmpty)) tokens += Bytes(tokenizer.Token()) + "|";
    EXPECT_EQ(tokens, test.tokens) << test.text;
    EXPECT_EQ(tokenizer.LastDelimiter(), test.last) << test.text;
    EXPECT_FALSE(tokenizer.NextToken(test.keepEmpty));
  }
  StringTokenizer one("a b", ' '), two("ab", ",;");
  EXPECT_TRUE(one.NextToken(false) && one.FoundDelimiter() && !one.HasManyDelimiters());
  EXPECT_TRUE(one.NextToken(false) && !one.FoundDelimiter());
  EXPECT_TRUE(two.HasManyDelimiters());
}
