// SPDX-License-Identifier: MIT
#include "TestSupport.h"

#include <stdlib.h>

#include <iostream>
#include <utility>

#include "cLib/cReport.h"

static int allocationsLeft = 0, allocationFailed = 0;

static void* TestMalloc(size_t bytes) {
  if (allocationsLeft == 0 || --allocationsLeft > 0) return malloc(bytes);
  return ++allocationFailed, nullptr;
}

// The library's own allocation, but for the place where its memory comes from.
#define malloc TestMalloc
#include "cLib/cMemory.cpp"
#undef malloc

bool FailAllocation(int n) {
  allocationsLeft = n;
  return std::exchange(allocationFailed, 0);
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

int CoreTest::Position(size_t size) {
  static const int extremes[] = {-1, INT_MIN, INT_MAX};
  return Below(8) ? static_cast<int>(Below(size + 3)) : extremes[Below(3)];
}

// Sizes that a 32-bit Windows process could not have fail natively, too.
extern "C" const char* __asan_default_options();
extern "C" const char* __asan_default_options() {
  return "allocator_may_return_null=1:max_allocation_size_mb=64";
}
