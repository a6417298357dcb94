// SPDX-License-Identifier: MIT
// What the Core library's tests share: allocations that fail on request, and recorded reports.
#pragma once

#include <gtest/gtest.h>
#include <limits.h>
#include <string.h>

#include <string>
#include <vector>

#include "cLib/cString.h"
#include "cLib/cTypes.h"

using namespace std::string_literals;
using Text = std::string;

// The n-th allocation from now fails (1: the next one; 0: none does).
void FailAllocation(int n);

// Records the debug-output lines of the test; there must be nothing left to fail after it.
class CoreTest : public testing::Test {
 protected:
  CoreTest();
  ~CoreTest() override;
  // How many lines since the last call contain `part`. All lines are forgotten.
  static int TakeReports(const Text& part = "");
  static std::vector<Text> reports;
};

// A container element that knows how many of its kind live.
struct Element {
  static int live;
  int id;
  explicit Element(int number = 0) : id(number) { ++live; }
  virtual ~Element() { --live; }
};

inline Text Bytes(const String& s) {
  return {s.Text(), s.Length()};
}
inline const char* No() {
  return nullptr;
}  // a null text that the compiler does not see through
