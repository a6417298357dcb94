// SPDX-License-Identifier: MIT
#include <algorithm>
#include <deque>
#include <map>
#include <memory>

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
  fifo.SetOwnsElements(false), fifo.Push(&element);
  const std::pair<const char*, std::function<bool()>> cases[] = {
      {"\"cArray\" (", [&] { return array.SetAt(none, -1) == -1; }},
      {"\"cArray\" (", [&] { return array.SetAt(none, INT_MAX) == -1; }},
      {"\"cArray\" (", [&] { return !array.Detach(1); }},
      {"\"cArray\" (", [&] { return array.Grow(0), true; }},
      {"\"cArray\" (", [&] { return FailAllocation(1), array.Grow(1), true; }},
      {"leak deteched", [&] { return array.SetAt(none, 0) == 0; }},
      {"\"cArray\" (", [&] { return FailAllocation(1), Array<Element>().SetAt(none, 0) == 0; }},
      {"\"cFilo\" (", [&] { return !fifo.SetAt(none, 1); }},
      {"leak deteched", [&] { return fifo.Push(&other); }},
      {"\"cFilo\" (", [&] { return fifo.SetAt(none, 0) && fifo.Push(none); }},
      {"\"cFilo\" (", [&] { return !FIFO<Element>(INT_MAX).Push(&element); }},
      {"\"cString\" (", [&] { return list.Add(nullptr, false), true; }},
      {"\"cString\" (", [&] { return !list.Value(0); }},
  };
  for (const auto& test : cases) {
    EXPECT_TRUE(test.second()) << &test - cases;
    EXPECT_EQ(TakeReports(test.first), 1) << &test - cases;
    EXPECT_TRUE(array.Count() == 1 && array.Capacity() == 50);
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
  int expected = 0;
  for (Element* e = cursor.First(); e; e = cursor.Next()) EXPECT_EQ(e->id, expected++);
  EXPECT_TRUE(expected == 60 && !cursor.Current() && !cursor.Next());
  for (; stack.Depth() > 30; delete stack.Pop()) EXPECT_EQ(stack.Top()->id, --expected);
  stack.Clear();
  EXPECT_EQ(Element::live, 63);
}

TEST_F(Containers, HashTableDeletesWhatItOwns) {
  EXPECT_EQ(HashBytes("Four score and seven years ago", 30, 0, false), 0x17770551u);
  EXPECT_EQ(HashBytes("FOUR SCORE A", 12, 42, true), HashBytes("four score a", 12, 42, false));
  EXPECT_EQ(HashBytes("Four score a", 12, 42, false), 0x4331CBFAu);
  static cHashTable<Element>* walked;
  cHashTable<Element> table;
  walked = &table;
  for (int i = 0; i < 1000; ++i)
    table.Insert(std::to_string(i).c_str(), reinterpret_cast<uintptr_t>(new Element(i)));
  table.Walk([](const char* key, u32 value) {
    EXPECT_EQ(std::to_string(reinterpret_cast<Element*>(value)->id), key);
    if (key[0] < '5') delete reinterpret_cast<Element*>(walked->Remove(key));
  });
  EXPECT_TRUE(Element::live < 600 && static_cast<int>(table.EntryCount()) == Element::live);
  table.Clear();
  for (int n = 1; n < 3; ++n) EXPECT_EQ((FailAllocation(n), table.Insert("key", 1)), 0u);
  EXPECT_TRUE(Element::live == 0 && table.EntryCount() == 0);
  table.Insert(nullptr, reinterpret_cast<uintptr_t>(new Element));
  EXPECT_NE(table.Find(""), 0u);
  FailAllocation(1);
  cHashTable<Element> none;
  EXPECT_EQ(none.Insert("key", 1) + none.Find("key") + none.Remove("key"), 0u);
}

TEST_F(Containers, TokenizerCutsAtDelimiters) {
  const std::tuple<const char*, const char*, char, bool, Text, char> cases[] = {
      {",a,,b,", ",", 0, true, "|a||b||", ','},
      {",a,;b,", ",;", 0, false, "a|b|", ','},
      {"", ",", 0, true, "|", 0},
      {"a,b", "", 0, false, "a,b|", 0},
      {"x'a,'y,'it''s'", ",", '\'', true, "xa,y|it's|", ','},
      {"'',a", ",", '\'', false, "|a|", ','},
      {"'a,b", ",", '\'', true, "a,b|", 0},
      {"a\xFF\xE9z", "\xFF\xE9", 0, true, "a||z|", '\xE9'},
  };
  for (const auto& [text, delimiters, quote, keepEmpty, expected, last] : cases) {
    StringTokenizer tokenizer(text, delimiters);
    tokenizer.SetQuote(quote);
    Text tokens;
    while (tokenizer.NextToken(keepEmpty)) tokens += Bytes(tokenizer.Token()) + "|";
    EXPECT_EQ(tokens, expected) << text;
    EXPECT_EQ(tokenizer.LastDelimiter(), last) << text;
  }
}

// --- Random operations compared with the standard containers -------------------------------------

TEST_F(Containers, ArrayAndFifoBehaveAsPlainLists) {
  Array<Element> array;
  FIFO<Element> fifo(7);
  std::vector<int> slots;  // -1: an empty slot
  std::deque<int> history(7, -1);
  const auto id = [](const Element* element) { return element ? element->id : -1; };
  for (int step = 0; step < 200000 && !HasFailure(); ++step) {
    const int pos = Position(Below(2) ? 7 : slots.size());
    const u32 at = static_cast<u32>(pos), operation = Below(5);
    auto element = std::make_unique<Element>(step);
    if (operation == 0 && array.SetAt(element.get(), pos) >= 0) {
      if (at >= slots.size()) slots.resize(at + 1, -1);
      slots[at] = element.release()->id;
    } else if (operation == 1) {
      delete array.Detach(pos);
      if (at < slots.size()) slots[at] = -1;
      if (slots.size() > 200) array.Clear(), slots.clear();
    } else if (operation == 2) {
      Element* const oldest = fifo.At(6);
      Element* const pushed = oldest && Below(2) ? oldest : element.release();
      history.push_front(pushed->id), history.pop_back();
      fifo.Push(pushed);
    } else if (operation == 3) {
      fifo.RemoveAt(pos);
      if (at < 7) history.erase(history.begin() + pos), history.push_back(-1);
    } else if (operation == 4 && fifo.SetAt(element.get(), pos)) {
      history.at(at) = element.release()->id;
    }
    element.reset();
    EXPECT_EQ(static_cast<size_t>(array.Count()), slots.size());
    EXPECT_EQ(id(array.At(pos)), at < slots.size() ? slots[at] : -1);
    for (u32 i = 0; i < 7; ++i) EXPECT_EQ(id(fifo.At(static_cast<i32>(i))), history[i]);
    const auto empty =
        std::count(slots.begin(), slots.end(), -1) + std::count(history.begin(), history.end(), -1);
    EXPECT_EQ(static_cast<int>(slots.size() + 7) - Element::live, empty) << "step " << step;
  }
}

TEST_F(Containers, HashTableBehavesAsAMap) {
  cHashTable<Element> real;
  real.SetOwnsElements(false);
  std::map<Text, u32> model;
  for (int step = 0; step < 100000 && !HasFailure(); ++step) {
    const Text key = Word(3);
    Text lower = key;
    std::replace(lower.begin(), lower.end(), 'A', 'a');
    const u32 old = model.contains(lower) ? model[lower] : 0, value = Below(3) + 1;
    EXPECT_EQ(real.Find(key.c_str()), old);
    const u32 operation = Below(3);
    if (operation == 0) {
      EXPECT_EQ(real.Insert(key.c_str(), value), old ? old : value);
      model[lower] = value;
    } else {
      const bool found = operation == 1 || old == value;
      EXPECT_EQ(found ? real.Remove(key.c_str()) : real.RemoveIfValue(key.c_str(), value),
                found * old);
      if (found) model.erase(lower);
    }
    EXPECT_EQ(real.EntryCount(), model.size()) << "step " << step;
  }
}

TEST_F(Containers, StringDZAndTokenizerKeepEveryText) {
  StringDZ real;
  Text joined;
  for (int step = 0; step < 100000 && !HasFailure(); ++step) {
    const Text text = step == 7 ? Text(5000, 'x') : Word(20);
    StringTokenizer all(text.c_str(), ", "), some(text.c_str(), ", ");
    Text kept;
    while (all.NextToken(true)) {
      const Text token = Bytes(all.Token());
      if (!token.empty()) EXPECT_TRUE(some.NextToken(false) && token == some.Token().Text());
      kept += token + (all.FoundDelimiter() ? Text(1, all.LastDelimiter()) : "");
    }
    EXPECT_TRUE(!some.NextToken(false) && kept == text) << text;

    const bool numbered = Below(2);
    if (real.Count() > 9) real.Clear(), joined.clear();
    if (!text.empty()) joined += (numbered ? std::to_string(real.Count()) + "=" : "") + text + '\0';
    real.Add(text.c_str(), numbered);
    if (numbered && !text.empty()) EXPECT_EQ(real.Value(real.Count() - 1), text);
    FailAllocation(Below(9) ? 0 : 1);
    const Text block(real.Joined(), 2);
    EXPECT_TRUE(!FailAllocation(0) || block == "\0\0"s);
    EXPECT_EQ(Text(real.Joined(), joined.size() + 1), joined + '\0') << "step " << step;
  }
}
