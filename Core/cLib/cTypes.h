// SPDX-License-Identifier: MIT
// Fixed-width integers of the Core library, the arithmetic that sizes go through, and the mark of
// builds whose class layouts are the host's.
#pragma once

#include <stdint.h>

using u8 = uint8_t;
using u32 = uint32_t;
using u64 = uint64_t;
using i32 = int32_t;

// 1 where the compiler lays out classes as the host editor does (32-bit Microsoft C++ ABI). The
// tests also build the portable code for other ABIs, where only the behaviour is the same.
#if defined(_WIN32) && !defined(__MINGW32__)
#define CORE_MICROSOFT_ABI 1
#else
#define CORE_MICROSOFT_ABI 0
#endif

// Largest size a block may ask for. A sum of sizes that would wrap becomes this value, so that the
// allocation fails instead of being too small.
constexpr u32 kLargestSize = 0xFFFFFFFFu;

constexpr u32 AddSizes(u32 a, u32 b) { return a > kLargestSize - b ? kLargestSize : a + b; }

constexpr u32 MultiplySizes(u32 a, u32 b) {
  return b != 0 && a > kLargestSize / b ? kLargestSize : a * b;
}
