// SPDX-License-Identifier: MIT
#include <locale.h>

#include <map>
#include <set>

#include "TestSupport.h"
#include "cLib/StringDZ.h"
#include "cLib/StringTokenizer.h"
#include "cLib/cFilo.h"
#include "cLib/cHashTable.h"

using Containers = CoreTest;

TEST_F(Containers, ReportMisuseAndChangeNothing) {
  Element element, other, *none = nullptr;
  Array<Element> array;
  FIFO<Element> fifo(1);
  StringDZ list;
  Stack<Element> stack;
  stack.SetOwnsElements(false);
  for (int i = 0; i < 50; ++i) stack.Push(&element);
  array.SetOwnsElements(false), array.SetAt(&element, 0);
  // As a host could leave it.
  Array<Element> broken;
  const auto breakCount = [&](i32 count) {
    *reinterpret_cast<i32*>(reinterpret_cast<char*>(&broken) + 8) = count;
    return broken.Count() == count;
  };
  const auto firstSlot = [&](Array<Element>&& empty) {
    return empty.SetAt(none, 0) == 0 ? empty.Capacity() : 0;
  };
  fifo.SetOwnsElements(false), fifo.Push(&element);
  const std::tuple<int, const char*, std::function<bool()>> cases[] = {
      {2, "cArray",
       [&] { return array.SetAt(none, -1) == -1 && array.SetAt(none, INT_MAX) == -1; }},
      {0, "leak deteched", [&] { return array.Clear(), array.SetAt(&element, 0) == 0; }},
      {3, "cArray", [&] { return array.Grow(0), array.Grow(-1), !array.Detach(1); }},
      {1, "cArray", [&] { return FailAllocation(1), array.Grow(1), true; }},
      {1, "beyond capacity",
       [&] { return breakCount(51) && (broken.Grow(1), broken.Clear(), broken.Count() == 0); }},
      {2, "beyond capacity",
       [&] { return breakCount(1000) && (broken.Grow(1), broken.Clear(), broken.Count() == 0); }},
      {1, "cArray", [&] { return FailAllocation(1), firstSlot(Array<Element>()) == 1; }},
      // The slots that a fifth more takes have no number of 32 bits with a sign.
      {1, "No memory for the slots", [&] { return array.SetAt(none, 1789569707) == -1; }},
      {1, "leak deteched", [&] { return array.SetAt(none, 0) == 0; }},
      {1, "leak deteched", [&] { return fifo.Push(&other); }},
      {2, "cFilo", [&] { return !fifo.SetAt(none, 1) && fifo.SetAt(none, 0) && fifo.Push(none); }},
      {1, "cFilo", [&] { return !FIFO<Element>(INT_MAX).Push(&element); }},
      {1, "cFilo", [&] { return FailAllocation(1), !stack.Push(&element); }},
      {1, "Size below one slot", [&] { return !FIFO<Element>(0).Push(&element); }},
      {2, "cString", [&] { return list.Add(nullptr, false), !list.Value(0); }},
      {1, "cString", [&] { return FailAllocation(2), list.Add("x", true), list.Count() == 0; }},
  };
  for (const auto& [count, report, holds] : cases) {
    EXPECT_TRUE(holds() && array.Count() == 1 && array.Capacity() == 50) << report;
    EXPECT_EQ(TakeReports(report), count);
  }
}

TEST_F(Containers, KeepOrderAndGrow) {
  Array<Element> array;
  for (const auto& [index, capacity] : {std::pair(49, 50u), {50, 110u}, {114, 246u}})
    EXPECT_TRUE(array.SetAt(new Element, index) == index && array.Capacity() == capacity);
  List<Element> list;
  Stack<Element> stack;
  ListIter<Element> cursor(list);
  EXPECT_TRUE(!cursor.First() && !stack.Pop() && !stack.Top());
  for (int i = 0; i < 60; ++i) list.SetAt(new Element(i), i), stack.Push(new Element(i));
  int id = 0;
  for (Element* e = cursor.First(); e; e = cursor.Next()) EXPECT_EQ(e->id, id++);
  EXPECT_TRUE(id == 60 && !cursor.Next() && stack.Depth() == 60);
  list.SetAt(new Element(60), 60);
  EXPECT_EQ(cursor.Current()->id, 60) << "a cursor past the end follows a list that grows";
  for (; stack.Depth() > 30; delete stack.Pop()) EXPECT_EQ(stack.Top()->id, --id);
  stack.Clear();
  EXPECT_EQ(Element::live, 64);
}

TEST_F(Containers, TokenizerCutsAtDelimiters) {
  const std::tuple<const char*, const char*, bool, Text> cases[] = {
      {",a,;b,", ",;", false, "a|b|,"}, {"", ",", true, "|"},
      {"a,b", "", false, "a,b|"},       {"x'a,'y,'it''s'", ",", true, "xa,y|it's|,"},
      {"'a,b", ",", true, "a,b|"},      {"'',a\xFF\xE9z", "\xFF\xE9,", true, "|a||z|\xE9"},
  };
  for (const auto& [text, delimiters, keepEmpty, expected] : cases) {
    StringTokenizer tokenizer(text, delimiters);
    tokenizer.SetQuote('\'');
    EXPECT_FALSE(tokenizer.FoundDelimiter() || tokenizer.LastDelimiter());
    Text tokens;
    while (tokenizer.NextToken(keepEmpty)) tokens += Bytes(tokenizer.Token()) + "|";
    EXPECT_EQ((tokens + tokenizer.LastDelimiter()).c_str(), expected) << text;
    EXPECT_EQ(tokenizer.HasManyDelimiters(), strlen(delimiters) > 1);
  }
  StringTokenizer single("a,;b", ',');
  EXPECT_TRUE(single.NextToken(true) && single.NextToken(true) && !single.HasManyDelimiters());
  EXPECT_EQ(Bytes(single.Token()), ";b");
}

TEST_F(Containers, FifoKeepsTheNewest) {
  FIFO<Element> fifo(3);
  const auto held = [&] {
    Text ids;
    for (int i = 0; i < 4; ++i) ids += fifo.At(i) ? std::to_string(fifo.At(i)->id) : "-";
    return ids + " " + std::to_string(Element::live);
  };
  for (int id : {1, 2, 3, 4}) fifo.Push(new Element(id));
  EXPECT_EQ(held(), "432- 3");
  fifo.RemoveAt(1);
  EXPECT_EQ(held(), "42-- 2");
  EXPECT_TRUE(fifo.SetAt(new Element(7), 0) && fifo.SetAt(fifo.At(0), 0));
  EXPECT_EQ(held(), "72-- 2");
}

TEST_F(Containers, HashTableFindsKeysInEitherCaseAndAnyLocale) {
  EXPECT_EQ(HashBytes("Four score and seven years ago", 30, 0, false), 0x17770551u);
  FailAllocation(1);
  cHashTable<Element> none;
  EXPECT_EQ(none.Insert("key", 1) + none.Find("key") + none.Remove("key"), 0u);
  {
    cHashTable<Element> table;
    table.SetOwnsElements(false);
    const std::pair<u32, u32> steps[] = {{table.Insert("Key", 1), 1},
                                         {table.Insert("kEY", 2), 1},
                                         {table.Find("KEY"), 2},
                                         {table.RemoveIfValue("key", 9), 0},
                                         {table.Find("keys"), 0},
                                         {table.Find("ke"), 0},
                                         {table.RemoveIfValue("key", 2), 2},
                                         {table.Remove("Key"), 0},
                                         {table.Insert(nullptr, 5), 5},
                                         {table.Find(""), 5},
                                         {table.Remove(nullptr), 5},
                                         {table.EntryCount(), 0},
                                         {table.Insert("[", 3), 3},
                                         {table.Find("{"), 0},
                                         {table.Find("["), 3}};
    for (const auto& [answer, expected] : steps)
      EXPECT_EQ(answer, expected) << &answer - &steps[0].first;
    for (int n : {1, 2}) {
      FailAllocation(n);
      EXPECT_TRUE(table.Insert("more", 1) == 0 && table.Find("more") == 0);
    }
  }
  // Every key there is of one byte and of two, in a table that is made in one locale and used in
  // another, which knows more letters.
  cHashTable<Element> table;
  std::set<Text> keys;
  std::map<Text, u32> values;
  for (int first = 1; first < 256; ++first)
    for (int second : {0, 0x78, 0xC4, 0xE4}) {
      Text key{static_cast<char>(first), static_cast<char>(second)};
      key.resize(strlen(key.c_str()));
      if (key[0] >= 'A' && key[0] <= 'Z') continue;
      keys.insert(key);
      values[key] = table.Insert(key.c_str(), reinterpret_cast<u32>(new Element));
    }
#if defined(_WIN32)
  ASSERT_TRUE(setlocale(LC_CTYPE, "German"));
#endif
  for (const auto& [key, value] : values) EXPECT_EQ(table.Find(key.c_str()), value) << key;
  static std::multiset<Text> walked;
  table.Walk([](const char* key, u32) { walked.insert(key); });
  EXPECT_TRUE(walked == std::multiset<Text>(keys.begin(), keys.end()));
  EXPECT_TRUE(table.EntryCount() == keys.size() && table.Find("AX") == table.Find("ax"));
  table.Clear();
  EXPECT_TRUE(table.EntryCount() == 0 && Element::live == 0);
  setlocale(LC_CTYPE, "C");
}

TEST_F(Containers, StringDZKeepsEveryText) {
  StringDZ real;
  EXPECT_EQ(*reinterpret_cast<u32*>(reinterpret_cast<char*>(&real) + 4), 170u) << "its mark";
  Text joined;
  for (int step = 0; step < 100000 && !HasFailure(); ++step) {
    const Text text = step == 7 ? Text(5000, 'x') : Word(20);
    const bool numbered = Below(2);
    if (real.Count() > 9) real.Clear(), joined.clear();
    if (!text.empty()) joined += (numbered ? std::to_string(real.Count()) + "=" : "") + text + '\0';
    real.Add(text.c_str(), numbered);
    if (numbered && !text.empty()) EXPECT_EQ(real.Value(real.Count() - 1), text);
    FailAllocation(Below(9) ? 0 : 1);
    const Text block(real.Joined(), 2);
    EXPECT_TRUE(!FailAllocation(0) || block == "\0\0"s);
    const Text expected = joined.empty() ? "\0\0"s : joined + '\0';
    EXPECT_EQ(Text(real.Joined(), expected.size()), expected) << "step " << step;
  }
  StringDZ many;
  joined = Text(30, 'x') + '\0';
  for (char ch = 'A'; ch <= 'Z'; ++ch) joined += Text(1, ch) + '\0';
  many.AddList(joined.c_str());
  FailAllocation(2);
  EXPECT_EQ(Text(many.Joined(), 84), joined + '\0') << "more than one block for all of them";
  FailAllocation(0);
  EXPECT_TRUE((many.AddList(nullptr), many.Count() == 27 && TakeReports("Null list") == 1));
}
