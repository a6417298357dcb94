// SPDX-License-Identifier: MIT
#include "xLib/xArgument.h"

void xArgument::SetText(const char* value) {
  kind = kText;
  text.Assign(value);
}

void xArgument::SetInteger(i32 value) {
  kind = kInteger;
  integer = value;
  real = value;
  text.Format("%ld", static_cast<long>(value));
}

void xArgument::SetReal(double value) {
  kind = kReal;
  // The conversion of a value that does not fit is undefined in C++; this is what the processor's
  // own instruction answers. The comparison is false for a value that is not a number.
  const bool fits = value > -2147483649.0 && value < 2147483648.0;
  integer = fits ? static_cast<i32>(value) : INT32_MIN;
  real = value;
  text.Format("%lf", value);
}
