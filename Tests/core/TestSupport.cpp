// SPDX-License-Identifier: MIT
#include "TestSupport.h"

#include <stdlib.h>

#include <iostream>
#include <stdexcept>
#include <utility>

#include "cLib/cReport.h"

void ModelFailed(const char* file, int line, const char* condition) {
  throw std::logic_error(file + (":" + std::to_string(line) + ": ") + condition);
}

CoreTest::CoreTest() {
  SetDebugHook([](const char* line) { reports.push_back(line); });
  const char* given = getenv("CORE_TEST_SEED");
  const u32 seed = given ? static_cast<u32>(strtoul(given, nullptr, 10)) : std::random_device()();
  std::cout << "CORE_TEST_SEED=" << seed << std::endl;  // there even if the test crashes
  random.seed(seed);
}

CoreTest::~CoreTest() {
  SetDebugHook(nullptr), FailAllocation(0), TakeReports();
  EXPECT_EQ(Element::live, 0);
}

int CoreTest::TakeReports(const Text& part) {
  int count = 0;
  for (const Text& line : std::exchange(reports, {})) count += line.find(part) != Text::npos;
  return count;
}

Text CoreTest::Word(u32 longest) {
  Text word(Below(longest + 1), 0);
  for (char& ch : word) ch = "aAb,, \t\x01\xE9"[Below(9)];
  return word;
}
