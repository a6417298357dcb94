// SPDX-License-Identifier: MIT
#include "LibraryBenchmark.h"

#include <algorithm>
#include <cctype>
#include <cstdio>
#include <functional>
#include <memory>
#include <string>
#include <unordered_map>
#include <vector>

#include "Section.h"
#include "cLib/cArray.h"
#include "cLib/cHashTable.h"
#include "cLib/cString.h"

namespace {

constexpr int kSizes[] = {10, 100, 1000, 10000, 100000, 1000000};
constexpr int kLeastWork = 20000;  // elements a measurement handles at least
constexpr double kLongestRun = 2;  // seconds; sizes that would take longer are left out
constexpr double kGrowth = 4;      // times a hundred elements' cost for each: grows with the size

volatile unsigned sink;  // keeps the compiler from leaving work out

// --- Text ----------------------------------------------------------------------------------------

std::string SourceText(int size) {
  std::string text;
  while (static_cast<int>(text.size()) < size) text += "some text, ";
  text.resize(size);
  return text;
}

void AppendOwn(int size) {
  String text;
  for (int i = 0; i < size; ++i) text.Append("x");
  sink = text.Length();
}
void AppendPeer(int size) {
  std::string text;
  for (int i = 0; i < size; ++i) text.append("x");
  sink = text.size();
}

void AssignOwn(int size) {
  static const std::string source = SourceText(kSizes[std::size(kSizes) - 1]);
  String text;
  text.Assign(source.c_str() + source.size() - size);
  sink = text.Length();
}
void AssignPeer(int size) {
  static const std::string source = SourceText(kSizes[std::size(kSizes) - 1]);
  std::string text;
  text.assign(source.c_str() + source.size() - size);
  sink = text.size();
}

// A number for each element, into one text and out of it.
void FormatOwn(int size) {
  String text;
  for (int i = 0; i < size; ++i) {
    text.Format("%d: %s", i, "text");
    sink = text.Length();
  }
}
void FormatPeer(int size) {
  std::string text;
  for (int i = 0; i < size; ++i) {
    char buffer[4096];
    const int length = _snprintf(buffer, sizeof buffer, "%d: %s", i, "text");
    text.assign(buffer, length);
    sink = text.size();
  }
}

constexpr char kComma[] = ", ";
constexpr char kOther[] = " and ";

void ReplaceOwn(int size) {
  String text(SourceText(size).c_str());
  sink = text.ReplaceAll(kComma, kOther) + text.Length();
}
// In one pass into another text, as one writes it.
void ReplacePeer(int size) {
  const std::string text = SourceText(size);
  std::string result;
  std::size_t from = 0;
  for (std::size_t at; (at = text.find(kComma, from)) != std::string::npos;) {
    result.append(text, from, at - from);
    result += kOther;
    from = at + sizeof kComma - 1;
  }
  result.append(text, from);
  sink = result.size();
}

void TrimOwn(int size) {
  String text(' ', size / 4);
  text.Append(std::string(size - size / 4 * 2, 'x').c_str());
  text.Append(std::string(size / 4, ' ').c_str());
  text.Trim();
  sink = text.Length();
}
void TrimPeer(int size) {
  std::string text(size / 4, ' ');
  text.append(std::string(size - size / 4 * 2, 'x').c_str());
  text.append(std::string(size / 4, ' ').c_str());
  const std::size_t first = text.find_first_not_of(" \t");
  if (first == std::string::npos) {
    text.clear();
  } else {
    text.erase(text.find_last_not_of(" \t") + 1);
    text.erase(0, first);
  }
  sink = text.size();
}

// --- Containers ----------------------------------------------------------------------------------

struct Element {
  explicit Element(int value) : number(value) {}
  virtual ~Element() = default;
  int number;
};

void ArrayOwn(int size) {
  Array<Element> elements;
  for (int i = 0; i < size; ++i) elements.SetAt(new Element(i), elements.Count());
  for (int i = 0; i < size; ++i) sink = elements.At(i)->number;
}
void ArrayPeer(int size) {
  std::vector<std::unique_ptr<Element>> elements;
  for (int i = 0; i < size; ++i) elements.push_back(std::make_unique<Element>(i));
  for (int i = 0; i < size; ++i) sink = elements[i]->number;
}

// Keys in mixed case: the table compares them without regard to case.
const std::vector<std::string>& Keys(int size) {
  static std::vector<std::string> keys;
  for (int i = static_cast<int>(keys.size()); i < size; ++i)
    keys.push_back((i % 2 ? "Key" : "key") + std::to_string(i));
  return keys;
}

std::string Folded(std::string key) {
  for (char& ch : key) ch = static_cast<char>(std::tolower(static_cast<unsigned char>(ch)));
  return key;
}

void TableOwn(int size) {
  const std::vector<std::string>& keys = Keys(size);
  cHashTable<Element> table;
  table.SetOwnsElements(false);
  for (int i = 0; i < size; ++i) table.Insert(keys[i].c_str(), i + 1);
  for (int i = 0; i < size; ++i) sink = table.Find(keys[i].c_str());
}
void TablePeer(int size) {
  const std::vector<std::string>& keys = Keys(size);
  std::unordered_map<std::string, unsigned> table;
  for (int i = 0; i < size; ++i) table.emplace(Folded(keys[i]), i + 1);
  for (int i = 0; i < size; ++i) sink = table.find(Folded(keys[i]))->second;
}

struct Case {
  const char* name;
  const char* design;  // why the time for each element grows, where it does
  const char* peerName;
  void (*own)(int size);
  void (*peer)(int size);
};
constexpr Case kCases[] = {
    {"String::Append", "", "std::string", AppendOwn, AppendPeer},
    {"String::Assign", "", "std::string", AssignOwn, AssignPeer},
    {"String::Format", "", "std::string", FormatOwn, FormatPeer},
    {"String::ReplaceAll", "", "std::string", ReplaceOwn, ReplacePeer},
    {"String::Trim", "", "std::string", TrimOwn, TrimPeer},
    {"Array", "", "std::vector", ArrayOwn, ArrayPeer},
    {"cHashTable", "a table always has 211 buckets", "std::unordered_map", TableOwn, TablePeer},
};

double SecondsPerElement(void (*work)(int), int size) {
  const int times = std::max(1, kLeastWork / size);
  return SecondsPerCall(times, [&] { work(size); }) / size;
}

std::string SizeText(int size) {
  return size >= 1000000 ? "1,000,000"
         : size >= 1000  ? std::to_string(size / 1000) + ",000"
                         : std::to_string(size);
}

// The times for each element of one case, as far as they can be waited for.
struct Curve {
  std::vector<double> times;

  // Whether the size after the last one would take too long: its cost for each element is taken to
  // grow as it did before.
  bool IsTooLong() const {
    if (times.empty()) return false;
    const double last = times.back();
    const double growth = times.size() > 1 ? std::max(1.0, last / times[times.size() - 2]) : 1;
    return last * growth * kSizes[times.size()] > kLongestRun;
  }
  // From which size on an element costs several times what it costs among a hundred; 0 for none.
  int GrowsFrom() const {
    for (std::size_t i = 2; i < times.size(); ++i)
      if (times[i] > kGrowth * times[1]) return kSizes[i];
    return 0;
  }
};

void CompareCase(Section& section, const Case& each) {
  std::string lines;
  std::string row = "| `" + std::string(each.name) + "` |";
  Curve curve;
  for (const int size : kSizes) {
    if (curve.IsTooLong()) break;
    Comparison comparison(each.name);
    comparison.Measured([&] { return SecondsPerElement(each.own, size); },
                        [&] { return SecondsPerElement(each.peer, size); }, size <= 10000 ? 5 : 1);
    curve.times.push_back(comparison.Time());
    const double nanoseconds = comparison.Time() * 1e9;
    char text[128];
    std::snprintf(text, sizeof text, ", %.*f ns |", nanoseconds < 10, nanoseconds);
    row += " " + comparison.RatioText() + text;
    std::snprintf(text, sizeof text, "\t%d\t%.3f\t%.3f\n", size, nanoseconds,
                  comparison.PeerTime() * 1e9);
    lines += each.name + std::string(text);
  }
  for (std::size_t left = curve.times.size(); left < std::size(kSizes); ++left) row += " - |";
  const int from = curve.GrowsFrom();
  std::string grows = from ? " from " + SizeText(from) : "";
  if (from && *each.design) grows += ": " + std::string(each.design);
  section.Print(row + grows + " |\n");
  const std::string title = each.name + (from ? ", grows" + grows : "");
  section.Chart(title + "\tsize\town\t" + each.peerName + "\n" + lines + "\n\n");
}

}  // namespace

bool CompareLibrary(Section& section) {
  section.Begin(
      "The Core library",
      "The time for each element as a multiple of `std::string`'s, `std::vector`'s and "
      "`std::unordered_map`'s doing the same work (the median of the rounds, with the least and "
      "the greatest), and in nanoseconds, for 10 to 1,000,000 elements (characters, for `Format` "
      "texts, for `Array` and `cHashTable` entries, put in and "
      "read). \"Grows\" is the size from which an element "
      "costs four times what it costs among a hundred. A dash: one run would take longer than " +
          TimeText(kLongestRun) + ".");
  std::string head = "| |";
  std::string line = "|---|";
  for (const int size : kSizes) {
    head += " " + SizeText(size) + " |";
    line += "---|";
  }
  section.Print(head + " grows |\n" + line + "---|\n");
  for (const Case& each : kCases) CompareCase(section, each);
  return true;
}
