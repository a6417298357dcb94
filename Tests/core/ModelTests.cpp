// SPDX-License-Identifier: MIT
// A million random operations compared with plain models. Under AddressSanitizer they also show
// that nothing touches memory outside its block. CORE_TEST_SEED repeats a run.
#include <algorithm>
#include <deque>
#include <functional>
#include <iostream>
#include <map>
#include <random>

#include "TestSupport.h"
#include "cLib/StringDZ.h"
#include "cLib/StringTokenizer.h"
#include "cLib/cFilo.h"
#include "cLib/cHashTable.h"

class Model : public CoreTest {
 protected:
  Model() {
    const char* given = getenv("CORE_TEST_SEED");
    const u32 seed = given ? static_cast<u32>(strtoul(given, nullptr, 10)) : std::random_device()();
    std::cout << "CORE_TEST_SEED=" << seed << '\n';
    random.seed(seed);
  }

  u32 Below(u32 n) { return static_cast<u32>(random() % n); }
  Text Word(u32 longest) {
    Text word(Below(longest + 1), 0);
    for (char& ch : word) ch = "aAb,, \t\x01\xE9"[Below(9)];
    return word;
  }
  // A position in or near what has `size` places, or an extreme one.
  int Position(u32 size) {
    static const int extremes[] = {-1, INT_MIN, INT_MAX};
    return Below(8) ? static_cast<int>(Below(size + 3)) : extremes[Below(3)];
  }

  std::mt19937 random;
};

static Text Cut(const Text& text) {
  return text.c_str();
}  // at its first NUL

static bool Replace(Text& text, size_t from, const Text& needle, const Text& with) {
  const size_t at = Text(text.c_str() + from).find(needle);
  if (at == Text::npos) return false;
  text = Cut(text.replace(from + at, needle.size(), with));
  return true;
}

static u32 ReplaceAll(Text& text, const Text& needle, const Text& with) {
  if (text.empty() || needle.empty()) return 0;
  text = Cut(text);
  u32 count = 0;
  for (size_t at = 0; (at = text.find(needle, at)) != Text::npos; at += with.size(), ++count)
    text.replace(at, needle.size(), with);
  return count;
}

static Text Utf8(const Text& latin1) {
  Text utf8;
  for (const char c : latin1)
    utf8 += c >= 0 ? Text(1, c) : c & 0x40 ? Text{'\xC3', char(c - 64)} : Text{'\xC2', c};
  return utf8;
}

TEST_F(Model, String) {
  String real;
  Text model, word, given, other;
  const char* argument = nullptr;  // an own text, or one that stands in the string itself
  char ch = 0;
  int pos = 0;
  u32 at = 0, size = 0, count = 0;  // `at` is the position, unsigned
  bool inside = false;              // at a character, or at 0
  const std::function<void()> operations[] = {
      [&] { real.Assign(argument), model = given; },
      [&] { real.AppendChar(ch), model += ch; },
      [&] {
        real.Append(argument, pos);
        if (pos == -1) model += given;
        if (pos > 0 && pos < INT_MAX) model += given.substr(0, at), model.resize(size + at);
      },
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
      [&] {
        EXPECT_EQ(Bytes(real.Mid(pos, count)), inside ? Cut(model.substr(at, count)) : "");
        EXPECT_EQ(Bytes(real.MidFrom(pos)), inside ? Cut(model.substr(at)) : "");
      },
      [&] {
        const bool found = at < size && !given.empty() && Replace(model, at, given, Text(1, ch));
        EXPECT_EQ(real.ReplaceFirstWithChar(argument, ch, at), found);
      },
      [&] {
        const bool tried = size && given != other;
        if (tried) model = Cut(model);
        EXPECT_EQ(real.Substitute(argument, other.c_str()),
                  tried && Replace(model, 0, given, other));
      },
      [&] { EXPECT_EQ(real.ReplaceAll(argument, other.c_str()), ReplaceAll(model, given, other)); },
      [&] { EXPECT_EQ(real.ReplaceAll(other.c_str(), argument), ReplaceAll(model, other, given)); },
      [&] {
        real.SetAt(pos, ch);
        if (pos < 0 || pos == INT_MAX) return;
        if (at >= size) model.resize(at + 1, ' ');
        model[at] = ch;
      },
      [&] {
        const size_t last = given.empty() || !inside ? Text::npos : model.rfind(given);
        const bool found = last != Text::npos && last >= at;
        EXPECT_EQ(real.FindReverse(argument, pos, true), found ? static_cast<int>(last) : -1);
        EXPECT_EQ(real.EndsWith(argument, true), !given.empty() && model.ends_with(given));
      },
      [&] { real.FromLatin1ToUtf8(argument), model = Utf8(given); },
      [&] { real.FromLatin1ToUtf8(argument, 5), model = Utf8(given.substr(0, 5)); },
      [&] { real.Format("%s|%s", argument, real.Text()), model = given + "|" + Cut(model); },
      [&] { real.Reserve(count % 60), real = String(real), model = Cut(model); },
      // Their texts are compared in StringTests.cpp.
      [&] { real.Trim(), real.CollapseBlanks(), real.RemoveControlChars(), model = Bytes(real); },
  };
  for (int step = 0; step < 600000 && !HasFailure(); ++step) {
    if (model.size() > 400) real.Assign(No()), model.clear();
    size = static_cast<u32>(model.size());
    word = Word(12), other = Word(4), ch = "a \xE9"[Below(4)], pos = Position(size);
    argument = Below(3) ? word.c_str() : real.Text() + Below(size + 1);
    given = argument, at = static_cast<u32>(pos), count = Below(8) ? Below(6) : UINT_MAX;
    inside = at < size || pos == 0;
    const u32 operation = Below(std::size(operations));
    operations[operation]();
    EXPECT_EQ(Bytes(real), model) << "step " << step << ", operation " << operation;
    EXPECT_TRUE(real.Length() < real.Capacity() && real.Text()[real.Length()] == 0) << operation;
  }
}

TEST_F(Model, ArrayAndFifo) {
  Array<Element> array;
  FIFO<Element> fifo(7);
  std::vector<int> slots;  // -1: an empty slot
  std::deque<int> history(7, -1);
  int pos = 0;
  u32 at = 0;
  const auto id = [](const Element* element) { return element ? element->id : -1; };
  const auto store = [&](auto&& into) {
    auto element = std::make_unique<Element>(pos);
    if (into(element.get())) element.release();
  };
  const std::function<void()> operations[] = {
      [&] {
        store([&](Element* element) { return array.SetAt(element, pos) >= 0; });
        if (pos < 0 || pos == INT_MAX) return;
        if (at >= slots.size()) slots.resize(at + 1, -1);
        slots[at] = pos;
      },
      [&] {
        delete array.Detach(pos);
        if (at < slots.size()) slots[at] = -1;
      },
      [&] {
        if (slots.size() > 200) array.Clear(), slots.clear();
      },
      [&] {
        store([&](Element* element) { return fifo.Push(element); });
        history.push_front(pos), history.pop_back();
      },
      [&] {
        fifo.RemoveAt(pos);
        if (at < 7) history.erase(history.begin() + pos), history.push_back(-1);
      },
      [&] {
        store([&](Element* element) { return fifo.SetAt(element, pos); });
        if (at < 7) history[at] = pos;
      },
  };
  for (int step = 0; step < 200000 && !HasFailure(); ++step) {
    pos = Position(Below(2) ? 7 : static_cast<u32>(slots.size())), at = static_cast<u32>(pos);
    operations[Below(std::size(operations))]();
    EXPECT_EQ(static_cast<size_t>(array.Count()), slots.size());
    EXPECT_EQ(id(array.At(pos)), at < slots.size() ? slots[at] : -1);
    for (int i = 0; i < 7; ++i) EXPECT_EQ(id(fifo.At(i)), history[static_cast<u32>(i)]);
    const auto empty =
        std::count(slots.begin(), slots.end(), -1) + std::count(history.begin(), history.end(), -1);
    EXPECT_EQ(Element::live, static_cast<int>(slots.size() + 7) - empty) << "step " << step;
  }
}

TEST_F(Model, HashTable) {
  cHashTable<Element> real;
  real.SetOwnsElements(false);
  std::map<Text, u32> model;
  for (int step = 0; step < 100000 && !HasFailure(); ++step) {
    const Text key = Word(3);
    Text lower = key;
    std::replace(lower.begin(), lower.end(), 'A', 'a');
    const u32 value = Below(3) + 1;
    const u32 old = model.contains(lower) ? model[lower] : 0;
    EXPECT_EQ(real.Find(key.c_str()), old);
    const u32 operation = Below(4);
    if (operation < 2)
      EXPECT_EQ(real.Insert(key.c_str(), value), old ? old : value);
    else if (operation == 2)
      EXPECT_EQ(real.Remove(key.c_str()), old);
    else
      EXPECT_EQ(real.RemoveIfValue(key.c_str(), value), old == value ? value : 0);
    if (operation < 2)
      model[lower] = value;
    else if (operation == 2 || old == value)
      model.erase(lower);
    EXPECT_EQ(real.EntryCount(), model.size()) << "step " << step;
  }
}

TEST_F(Model, ListsAndTokens) {
  StringDZ real;
  std::vector<Text> model;
  for (int step = 0; step < 100000 && !HasFailure(); ++step) {
    const Text text = Word(20);
    StringTokenizer all(text.c_str(), ", "), some(text.c_str(), ", ");
    Text kept;
    while (all.NextToken(true)) {
      const Text token = Bytes(all.Token());
      if (!token.empty()) EXPECT_TRUE(some.NextToken(false) && token == some.Token().Text());
      kept += token + text.substr(std::min(kept.size() + token.size(), text.size()), 1);
    }
    EXPECT_FALSE(some.NextToken(false));
    EXPECT_EQ(kept, text);

    if (model.size() > 9) real.Clear(), model.clear();
    const bool numbered = Below(2);
    if (!text.empty()) model.push_back((numbered ? std::to_string(model.size()) + "=" : "") + text);
    real.Add(text.c_str(), numbered);
    Text joined;
    for (const Text& entry : model) joined += entry + '\0';
    joined += '\0';
    EXPECT_EQ(Text(real.Joined(), joined.size()), joined) << "step " << step;
  }
}
