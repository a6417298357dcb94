// SPDX-License-Identifier: MIT
#include "Model.h"

#include <stdlib.h>

#include <utility>

static int allocationsLeft = 0;
static bool allocationFailed = false;

// Larger ones fail everywhere, as they might in a 32-bit process, and do not count.
static constexpr size_t kLargestBlock = 64 << 20;

static void* TestMalloc(size_t bytes) {
  if (bytes > kLargestBlock) return nullptr;
  if (allocationsLeft == 0 || --allocationsLeft > 0) return malloc(bytes);
  allocationFailed = true;
  return nullptr;
}

// The library's own allocation, but for the place where its memory comes from.
#define malloc TestMalloc
#include "cLib/cMemory.cpp"
#undef malloc

bool FailAllocation(int n) {
  allocationsLeft = n;
  return std::exchange(allocationFailed, false);
}

char AnyCharacter(Input& input) {
  const u32 byte = Below(input, 256);
  if (byte >= 30) return "aAb,; \t\x01\xE9'"[byte % 10];
  return static_cast<char>(1 + Below(input, 255));
}

std::string AnyText(Input& input, u32 longest) {
  std::string text(Below(input, longest + 1), '\0');
  for (char& ch : text) ch = AnyCharacter(input);
  return text;
}

int AnyPlace(Input& input, size_t size) {
  static constexpr int kExtremes[] = {-1, INT32_MIN, INT32_MAX};
  const u32 choice = Below(input, 65536);
  return choice < 8192 ? kExtremes[choice % 3] : static_cast<int>(choice % (size + 3));
}
