// SPDX-License-Identifier: MIT
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
  EXPECT_EQ(cursor.Current()->id, 60) << "a cursor past the end stands where the list grows";
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

TEST_F(Containers, HashTableHashesEveryByteAndLivesWithoutMemory) {
  const char* const kText = "Four score and seven years ago";
  EXPECT_EQ(HashBytes(kText, 30, 0, false), 0x17770551u);
  for (u32 n = 0; n < 26; ++n)
    EXPECT_EQ(HashBytes(kText, n, 0, false), HashBytes(Text(kText, n).c_str(), n, 0, false)) << n;
  for (u32 n = 1; n < 26; ++n)
    for (u32 i = 0; i < n; ++i) {
      const Text changed = Text(kText).replace(i, 1, "?");
      EXPECT_NE(HashBytes(kText, n, 0, false), HashBytes(changed.c_str(), n, 0, false)) << i;
    }
  EXPECT_EQ(HashBytes("FOUR SCORE A", 12, 42, true), HashBytes("four score a", 12, 42, false));
  FailAllocation(1);
  cHashTable<Element> none;
  EXPECT_EQ(none.Insert("key", 1) + none.Find("key") + none.Remove("key"), 0u);
}

TEST_F(Containers, AnElementLeavesItsSlotBeforeItIsDeleted) {
  struct Looking : Element {
    const FIFO<Element>& fifo;
    explicit Looking(const FIFO<Element>& history) : fifo(history) {}
    ~Looking() override { EXPECT_EQ(fifo.At(0), nullptr); }
  };
  FIFO<Element> fifo(1);
  fifo.Push(new Looking(fifo)), fifo.RemoveAt(0);
}

// Nobody may, but it costs no more than the elements that are not deleted.
TEST_F(Containers, HashTableBearsElementsThatClearAnother) {
  static std::set<Element*> alive;
  struct Clearing : Element {
    cHashTable<Element>& other;
    explicit Clearing(cHashTable<Element>& table) : other(table) { alive.insert(this); }
    ~Clearing() override { other.Clear(), alive.erase(this); }
  };
  cHashTable<Element> other;
  {
    cHashTable<Element> table;
    for (const char* key : {"a", "b", "c"})
      table.Insert(key, reinterpret_cast<u32>(new Clearing(other)));
    table.Clear();
    EXPECT_TRUE(table.EntryCount() == 2 && alive.size() == 2);
  }
  ASSERT_EQ(alive.size(), 1u) << "the destructor has deleted one more";
  delete *alive.begin();
}

TEST_F(Containers, HashTableIsWalkedBucketByBucketNewestFirst) {
  const auto bucket = [](const Text& key) {
    return HashBytes(key.c_str(), static_cast<u32>(key.size()), 42, true) % 0x10000 % 211;
  };
  cHashTable<Element> table;
  table.SetOwnsElements(false);
  for (u32 i = 1; i <= 500; ++i) table.Insert(std::to_string(i).c_str(), i);
  std::multimap<u32, u32> expected;
  for (u32 i = 500; i > 0; --i) expected.emplace(bucket(std::to_string(i)), i);
  static std::vector<u32> walked;
  table.Walk([](const char*, u32 value) { walked.push_back(value); });
  ASSERT_EQ(walked.size(), 500u);
  for (auto each = walked.begin(); const auto& [place, value] : expected)
    EXPECT_EQ(*each++, value) << "in bucket " << place;
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
