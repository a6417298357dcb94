// SPDX-License-Identifier: MIT
// An argument of a macro function call, as the module passes it. Plain C data, because code of both
// C++ ABIs uses it.
#pragma once

#include <stdint.h>

// The id of a name that is no macro function.
constexpr uint32_t kUnknownId = 2000;

enum HostArgumentKind : uint32_t { kTextArgument = 1, kIntegerArgument = 2, kRealArgument = 3 };

struct HostArgument {
  double real;       // of a real
  const char* text;  // of every kind; owned by the caller, valid during the call
  int32_t integer;   // of an integer
  HostArgumentKind kind;
};
