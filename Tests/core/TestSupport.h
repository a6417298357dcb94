// SPDX-License-Identifier: MIT
// What the Core library's tests share besides what the models have: recorded reports, and random
// operations, repeatable by the environment variable CORE_TEST_SEED.
#pragma once

#include <gtest/gtest.h>
#include <limits.h>
#include <string.h>

#include <functional>
#include <random>
#include <string>
#include <vector>

#include "../models/Model.h"

using namespace std::string_literals;
using Text = std::string;

class CoreTest : public testing::Test {
 protected:
  CoreTest();
  ~CoreTest() override;

  // How many debug-output lines since the last call contain `part`. All lines are forgotten.
  static int TakeReports(const Text& part = "");
  static inline std::vector<Text> reports;

  u32 Below(size_t n) { return static_cast<u32>(random() % n); }
  Text Word(u32 longest);
  std::mt19937 random;
};
