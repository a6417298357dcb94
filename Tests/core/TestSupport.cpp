// SPDX-License-Identifier: MIT
#include "TestSupport.h"

#include <stdlib.h>

#include "cLib/cReport.h"

static int allocationsLeft = 0;
static std::vector<std::string> lines;

int Element::live = 0;

static void* TestMalloc(size_t bytes) {
  if (allocationsLeft == 0 || --allocationsLeft > 0) return malloc(bytes);
  return nullptr;
}

// The library's own allocation, but for the place where its memory comes from.
#define malloc TestMalloc
#include "cLib/cMemory.cpp"
#undef malloc

void FailAllocation(int n) {
  allocationsLeft = n;
}

Reports::Reports() {
  lines.clear();
  SetDebugHook([](const char* line) { lines.push_back(line); });
}

Reports::~Reports() {
  SetDebugHook(nullptr);
}

int Reports::Take(const std::string& part) {
  int count = 0;
  for (const auto& line : lines) count += line.find(part) != std::string::npos;
  lines.clear();
  return count;
}

std::vector<std::string>& Reports::Lines() {
  return lines;
}

// Sizes that a 32-bit Windows process could not have fail natively, too.
extern "C" const char* __asan_default_options();
extern "C" const char* __asan_default_options() {
  return "allocator_may_return_null=1:max_allocation_size_mb=64";
}
