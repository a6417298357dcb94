// SPDX-License-Identifier: MIT
// What the Core library's tests share: allocations that fail on request, recorded reports, and
// random operations, repeatable by the environment variable CORE_TEST_SEED.
#pragma once

#include <gtest/gtest.h>
#include <limits.h>
#include <string.h>

#include <functional>
#include <random>
#include <string>
#include <vector>

#include "cLib/cString.h"
#include "cLib/cTypes.h"

using namespace std::string_literals;
using Text = std::string;

// The n-th allocation from now fails (1: the next one; 0: none does). Returns whether the one of
// the last call has failed.
bool FailAllocation(int n);

class CoreTest : public testing::Test {
 protected:
  CoreTest();
  ~CoreTest() override;

  // How many debug-output lines since the last call contain `part`. All lines are forgotten.
  static int TakeReports(const Text& part = "");
  static inline std::vector<Text> reports;

  u32 Below(size_t n) { return static_cast<u32>(random() % n); }
  Text Word(u32 longest);
  int Position(size_t size);  // in or near what has `size` places, or an extreme one
  std::mt19937 random;
};

// A container element that knows how many of its kind live.
struct Element {
  static inline int live = 0;
  int id;
  explicit Element(int number = 0) : id(number) { ++live; }
  virtual ~Element() { --live; }
};

inline Text Bytes(const String& s) { return {s.Text(), s.Length()}; }
