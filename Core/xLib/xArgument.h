// SPDX-License-Identifier: MIT
// One macro-function argument as the host receives it: its kind, and the value in all three forms
// where the kind has them (a text argument carries only its text).
//
// The host reads these records by byte offset through the context record's argument list, which
// owns them for one call. Threading: the macro run's thread.
#pragma once

#include <stddef.h>

#include "cLib/cSlots.h"
#include "cLib/cString.h"

class xArgument {
 public:
  enum Kind : u32 { kText = 1, kInteger = 2, kReal = 3 };

  explicit xArgument(const char* value) : text(value) {}
  explicit xArgument(i32 value);
  explicit xArgument(u64 bits);  // of a real, whose value is never loaded: see xArgument.cpp

  SLOTS_FROM(0);
  SLOT(0) ~xArgument() = default;

  u32 kind = kText;
  i32 integer = 0;  // a real's is truncated toward zero, -2147483648 when it does not fit
  double real = 0;
  String text;  // an integer's in decimal, a real's with six decimals

 private:
  xArgument(u64 bits, const struct RealParts& parts);
};

#if CORE_MICROSOFT_ABI
static_assert(offsetof(xArgument, kind) == 8, "the host reads it here");
static_assert(offsetof(xArgument, integer) == 12, "the host reads it here");
static_assert(offsetof(xArgument, real) == 16, "the host reads it here");
static_assert(offsetof(xArgument, text) == 24, "the host reads it here");
static_assert(sizeof(xArgument) == 48, "the host's elements");
#endif
