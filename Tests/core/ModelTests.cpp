// SPDX-License-Identifier: MIT
// A million random operations compared with plain models. Under AddressSanitizer they also show
// that nothing touches memory outside its block. CORE_TEST_SEED repeats a run.
#include <gtest/gtest.h>
#include <limits.h>
#include <string.h>

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

class Model : public testing::Test {
 protected:
  Model() {
    const char* given = getenv("CORE_TEST_SEED");
    const u32 seed = given ? static_cast<u32>(strtoul(given, nullptr, 10)) : std::random_device()();
    std::cout << "CORE_TEST_SEED=" << seed << '\n';
    RecordProperty("seed", std::to_string(seed));
    random.seed(seed);
  }

  u32 Below(u32 n) { return static_cast<u32>(random() % n); }
  char Char() { return "aAb,, \t\x01\xE9"[Below(10)]; }  // the tenth is NUL
  std::string Word(u32 longest) {
    std::string word(Below(longest + 1), 0);
    for (char& ch : word) do
        ch = Char();
      while (!ch);
    return word;
  }
  // A position in or near a text of `size` characters, or an extreme one.
  int Position(u32 size) {
    static const int extremes[] = {-1, INT_MIN, INT_MAX};
    return Below(8) ? static_cast<int>(Below(size + 3)) : extremes[Below(3)];
  }
  u32 Count() { return Below(8) ? Below(6) : 0xFFFFFFFF; }

  std::mt19937 random;
  Reports reports;  // misuse is part of the game
};

using Text = std::string;

static void CutAtNul(Text& text) {
  text.resize(strlen(text.c_str()));
}
static bool Blank(char ch) {
  return ch == ' ' || ch == '\t';
}

// Deletes every character that `condemned` names by its place, as long as there is one.
static void DeleteWhere(Text& text, const std::function<bool(size_t)>& condemned) {
  for (size_t i = 0; i < text.size();) {
    if (!condemned(i)) {
      ++i;
      continue;
    }
    text.erase(i, 1);
    CutAtNul(text);
  }
}

static u32 ReplaceAll(Text& text, const Text& needle, const Text& with) {
  if (text.empty() || needle.empty()) return 0;
  CutAtNul(text);
  u32 count = 0;
  for (size_t at = 0; (at = text.find(needle, at)) != Text::npos; at += with.size(), ++count)
    text.replace(at, needle.size(), with);
  return count;
}

static bool Replace(Text& text, size_t from, const Text& needle, const Text& with) {
  const size_t at = from + Text(text.c_str() + from).find(needle);
  if (at + 1 == from) return false;
  text.replace(at, needle.size(), with);
  return true;
}

TEST_F(Model, String) {
  String real;
  Text model;
  for (int step = 0; step < 600000; ++step) {
    if (model.size() > 400) real.Assign(No()), model.clear();
    const u32 size = static_cast<u32>(model.size());
    // An argument that is an own text, or one that stands in the string itself.
    const Text word = Word(12);
    const char* argument = Below(3) ? word.c_str() : real.Text() + Below(size + 1);
    const Text given = argument, other = Word(4);
    const char ch = Char();
    const int pos = Position(size);
    const u32 count = Count();
    const bool inside = pos >= 0 && static_cast<u32>(pos) < size;
    const bool insideOrFirst = inside || pos == 0;
    const u32 operation = Below(20);
    switch (operation) {
      case 0:
        real.Assign(argument);
        model = given;
        break;
      case 1: {
        const int len = Below(2) ? -1 : pos;
        real.Append(argument, len);
        if (len == -1) model += given;
        if (len >= 0 && len != INT_MAX) {
          const u32 added = static_cast<u32>(len);
          model += given.substr(0, added);
          model.resize(size + added);
        }
        break;
      }
      case 2:
        real.AppendChar(ch);
        model += ch;
        break;
      case 3:
        real.InsertChar(ch, pos);
        if (!inside && pos != static_cast<int>(size)) break;
        model.insert(static_cast<u32>(pos), 1, ch);
        model.resize(size + (ch != 0));
        break;
      case 4:
        real.Insert(argument, pos);
        if (!insideOrFirst || given.empty()) break;
        model.insert(static_cast<u32>(pos), given);
        CutAtNul(model);
        break;
      case 5:
        real.Delete(pos, count);
        if (!insideOrFirst) break;
        model.erase(static_cast<u32>(pos), count);
        CutAtNul(model);
        break;
      case 6:
        ASSERT_EQ(Bytes(real.Mid(pos, count)),
                  inside ? model.substr(static_cast<u32>(pos), count).c_str() : "");
        ASSERT_EQ(Bytes(real.MidFrom(pos)),
                  inside ? model.substr(static_cast<u32>(pos)).c_str() : "");
        break;
      case 7:
        real.Trim();
        model.erase(0, model.find_first_not_of(" \t"));
        CutAtNul(model);
        model.erase(model.find_last_not_of(" \t") + 1);
        break;
      case 8:
        real.CollapseBlanks();
        DeleteWhere(model, [&](size_t i) { return i && Blank(model[i]) && Blank(model[i - 1]); });
        break;
      case 9:
        real.RemoveControlChars();
        DeleteWhere(model, [&](size_t i) { return static_cast<signed char>(model[i]) < 32; });
        break;
      case 10: {
        const u32 from = static_cast<u32>(pos);
        const bool found = inside && !given.empty() && Replace(model, from, given, Text(1, ch));
        if (found) CutAtNul(model);
        ASSERT_EQ(real.ReplaceFirstWithChar(argument, ch, from), found);
        break;
      }
      case 11: {
        const bool tried = size && given != other;
        const bool found = tried && Replace(model, 0, given, other);
        if (tried) CutAtNul(model);
        ASSERT_EQ(real.Substitute(argument, other.c_str()), found);
        break;
      }
      case 12:
        ASSERT_EQ(real.ReplaceAll(argument, other.c_str()), ReplaceAll(model, given, other));
        break;
      case 13:
        ASSERT_EQ(real.ReplaceAll(other.c_str(), argument), ReplaceAll(model, other, given));
        break;
      case 14:
        if (pos == INT_MAX) break;
        real.SetPadChar('*');
        real.SetAt(pos, ch);
        if (pos < 0) break;
        if (!inside)
          model.append(static_cast<u32>(pos) - size + 1, pos == static_cast<int>(size) ? ' ' : '*');
        model[static_cast<u32>(pos)] = ch;
        break;
      case 15: {
        const size_t last = given.empty() || !insideOrFirst ? Text::npos : model.rfind(given);
        const bool found = last != Text::npos && last >= static_cast<u32>(pos);
        ASSERT_EQ(real.FindReverse(argument, pos, true), found ? static_cast<int>(last) : -1);
        break;
      }
      case 16:
        ASSERT_EQ(real.Equals(argument, true), model == given);
        ASSERT_EQ(real.EndsWith(argument, true), !given.empty() && model.ends_with(given));
        ASSERT_EQ(real.CountChar(ch), std::count(model.begin(), model.end(), ch));
        ASSERT_EQ(real.SkipBlanks(), std::min<size_t>(model.find_first_not_of(" \t"), size));
        break;
      case 17: {
        const int n = Below(2) ? -1 : 5;
        real.FromLatin1ToUtf8(argument, n);
        model.clear();
        for (const char c : given.substr(0, static_cast<size_t>(n)))
          model += c >= 0 ? Text(1, c) : c & 0x40 ? Text{'\xC3', char(c - 64)} : Text{'\xC2', c};
        break;
      }
      case 18:
        real.Format("%s|%s", argument, real.Text());
        model = given + "|" + model.c_str();
        break;
      case 19:
        real.Reserve(Below(60));
        real = Below(2) ? String(real) : real;
        CutAtNul(model);
        break;
    }
    ASSERT_EQ(Bytes(real), model) << "step " << step << ", operation " << operation;
    ASSERT_LT(real.Length(), real.Capacity()) << "step " << step << ", operation " << operation;
    ASSERT_EQ(real.Text()[real.Length()], 0) << "step " << step << ", operation " << operation;
  }
}

TEST_F(Model, Array) {
  Array<Element> real;
  std::vector<int> model;  // -1: an empty slot
  for (int step = 0; step < 100000; ++step) {
    const int pos = Position(std::min<u32>(static_cast<u32>(model.size()) + 20, 300));
    const u32 place = static_cast<u32>(pos);
    switch (Below(Below(50) ? 3 : 4)) {
      case 0:
      case 1: {
        auto element = std::make_unique<Element>(step);
        if (real.SetAt(element.get(), pos) < 0) break;
        element.release();
        if (place >= model.size()) model.resize(place + 1, -1);
        model[place] = step;
        break;
      }
      case 2:
        delete real.Detach(pos);
        if (place < model.size()) model[place] = -1;
        break;
      case 3:
        real.Clear();
        model.clear();
        break;
    }
    ASSERT_EQ(static_cast<size_t>(real.Count()), model.size());
    ASSERT_LE(model.size(), real.Capacity());
    const Element* element = real.At(pos);
    ASSERT_EQ(element ? element->id : -1, place < model.size() ? model[place] : -1);
    ASSERT_EQ(Element::live,
              std::count_if(model.begin(), model.end(), [](int id) { return id >= 0; }));
  }
}

TEST_F(Model, Fifo) {
  FIFO<Element> real(7);
  std::deque<int> model(7, -1);
  for (int step = 0; step < 100000; ++step) {
    const int pos = Position(7);
    const bool inside = pos >= 0 && pos < 7;
    switch (Below(3)) {
      case 0:
        real.Push(new Element(step));
        model.push_front(step);
        model.pop_back();
        break;
      case 1:
        real.RemoveAt(pos);
        if (!inside) break;
        model.erase(model.begin() + pos);
        model.push_back(-1);
        break;
      case 2:
        if (auto* element = new Element(step); !real.SetAt(element, pos)) delete element;
        if (inside) model[static_cast<u32>(pos)] = step;
        break;
    }
    for (int i = 0; i < 7; ++i)
      ASSERT_EQ(real.At(i) ? real.At(i)->id : -1, model[static_cast<u32>(i)]) << "step " << step;
    ASSERT_EQ(Element::live, 7 - std::count(model.begin(), model.end(), -1));
  }
}

TEST_F(Model, HashTable) {
  cHashTable<Element> real;
  real.SetOwnsElements(false);
  std::map<Text, u32> model;
  static u32 walked;
  for (int step = 0; step < 100000; ++step) {
    const Text key = Word(3);
    Text lower = key;
    for (char& ch : lower) ch = ch == 'A' ? 'a' : ch;
    const u32 value = Below(3) + 1;
    const auto entry = model.find(lower);
    const u32 old = entry == model.end() ? 0 : entry->second;
    ASSERT_EQ(real.Find(key.c_str()), old) << "step " << step;
    if (Below(3)) {
      ASSERT_EQ(real.Insert(key.c_str(), value), old ? old : value);
      model[lower] = value;
    } else if (Below(2)) {
      ASSERT_EQ(real.Remove(key.c_str()), old);
      model.erase(lower);
    } else {
      ASSERT_EQ(real.RemoveIfValue(key.c_str(), value), old == value ? value : 0);
      if (old == value) model.erase(lower);
    }
    ASSERT_EQ(real.EntryCount(), model.size()) << "step " << step;
  }
  walked = 0;
  real.Walk([](const char*, u32) { ++walked; });
  EXPECT_EQ(walked, model.size());
}

TEST_F(Model, ListsAndTokens) {
  StringDZ real;
  std::vector<Text> model;
  for (int step = 0; step < 100000; ++step) {
    if (model.size() > 9) real.Clear(), model.clear();
    const Text text = Word(20);
    Text kept;
    std::vector<Text> tokens;
    StringTokenizer all(text.c_str(), ", "), some(text.c_str(), ", ");
    while (all.NextToken(true)) tokens.push_back(Bytes(all.Token()));
    for (const Text& token : tokens) {
      if (!token.empty()) ASSERT_TRUE(some.NextToken(false) && token == some.Token().Text());
      kept += token + text.substr(std::min(kept.size() + token.size(), text.size()), 1);
    }
    ASSERT_FALSE(some.NextToken(false));
    ASSERT_EQ(kept, text);
    ASSERT_EQ(tokens.size(), 1u + std::count_if(text.begin(), text.end(),
                                                [](char ch) { return ch == ',' || ch == ' '; }));

    const bool numbered = Below(2);
    real.Add(text.c_str(), numbered);
    if (!text.empty()) model.push_back((numbered ? std::to_string(model.size()) + "=" : "") + text);
    Text joined;
    for (const Text& entry : model) joined += entry + '\0';
    joined += '\0';
    ASSERT_EQ(Text(real.Joined(), joined.size()), joined) << "step " << step;
  }
}
