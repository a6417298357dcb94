// SPDX-License-Identifier: MIT
// What the Core library's tests share: allocations that fail on request, and recorded reports.
#pragma once

#include <ostream>
#include <string>
#include <tuple>
#include <vector>

#include "cLib/cString.h"
#include "cLib/cTypes.h"

// The n-th allocation from now fails (1: the next one; 0: none does).
void FailAllocation(int n);

// Records the debug-output lines while it lives. One at a time.
class Reports {
 public:
  Reports();
  ~Reports();
  // The lines since the last call that contain `part`; all lines are forgotten.
  int Take(const std::string& part = "");
  std::vector<std::string>& Lines();
};

// A container element that knows how many of its kind live.
struct Element {
  static int live;
  int id;
  explicit Element(int number = 0) : id(number) { ++live; }
  virtual ~Element() { --live; }
};

inline std::string Bytes(const String& s) {
  return {s.Text(), s.Length()};
}
inline const char* No() {
  return nullptr;
}  // a null text that no compiler looks through

// All that can be seen of a string.
inline auto State(const String& s) {
  return std::tuple(Bytes(s), s.Capacity(), s.GrowBy());
}

// Prints in failures what it holds.
inline void PrintTo(const String& s, std::ostream* out) {
  *out << '"' << Bytes(s) << '"';
}
