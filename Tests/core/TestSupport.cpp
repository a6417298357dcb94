// SPDX-License-Identifier: MIT
#include "TestSupport.h"

#include <stdlib.h>

#include "cLib/cReport.h"

static int allocationsLeft = 0;

static void* TestMalloc(size_t bytes) {
  return allocationsLeft && --allocationsLeft == 0 ? nullptr : malloc(bytes);
}

// The library's own allocation, but for the place where its memory comes from.
#define malloc TestMalloc
#include "cLib/cMemory.cpp"
#undef malloc

void FailAllocation(int n) {
  allocationsLeft = n;
}

int Element::live = 0;
std::vector<Text> CoreTest::reports;

CoreTest::CoreTest() {
  SetDebugHook([](const char* line) { reports.push_back(line); });
}

CoreTest::~CoreTest() {
  SetDebugHook(nullptr);
  FailAllocation(0);
  TakeReports();
  EXPECT_EQ(Element::live, 0);
}

int CoreTest::TakeReports(const Text& part) {
  int count = 0;
  for (const Text& line : std::exchange(reports, {})) count += line.find(part) != Text::npos;
  return count;
}

// Sizes that a 32-bit Windows process could not have fail natively, too.
extern "C" const char* __asan_default_options();
extern "C" const char* __asan_default_options() {
  return "allocator_may_return_null=1:max_allocation_size_mb=64";
}
