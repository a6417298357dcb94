// SPDX-License-Identifier: MIT
#include "xLib/xArgument.h"

#include <locale.h>

// Room for a whole number of 32 bits, a sign, a point and six decimals.
static constexpr u32 kNumberSize = 24;

// Writes the digits of `value` so that they end before `end`, at least `least` of them, and returns
// where they begin.
static char* WriteDigits(char* end, u32 value, int least) {
  for (; value != 0 || least > 0; value /= 10, --least)
    *--end = static_cast<char>('0' + value % 10);
  return end;
}

// A real's size, rounded to six decimals.
struct Decimal {
  u32 whole;
  u32 millionths;
};

// False where the sixth decimal takes more care than is worthwhile: next to a tie, and beyond 31
// bits. Elsewhere the error of the one multiplication is too small to matter, so that the result is
// every correct C runtime's.
static bool Round(double size, Decimal& decimal) {
  if (!(size < 2147483647.0)) return false;
  decimal.whole = static_cast<u32>(static_cast<i32>(size));
  const double millionths = (size - decimal.whole) * 1e6;
  decimal.millionths = static_cast<u32>(static_cast<i32>(millionths + 0.5));
  const double distance = millionths - decimal.millionths;
  if (distance > 0.4999 || distance < -0.4999) return false;
  if (decimal.millionths == 1000000) decimal = {decimal.whole + 1, 0};
  return true;
}

// The decimal point that the C runtime writes; 0 when it is no single character.
static char DecimalPoint() {
  const char* const point = localeconv()->decimal_point;
  return point[0] && !point[1] ? point[0] : '\0';
}

// As %lf writes it, in `number`; null when the C runtime has to do it.
static const char* WriteReal(double value, char (&number)[kNumberSize]) {
  const bool negative = value < 0 || (value == 0 && 1 / value < 0);
  const char point = DecimalPoint();
  Decimal decimal;
  if (!point || !Round(negative ? -value : value, decimal)) return nullptr;
  char* start = number + kNumberSize - 1;
  *start = 0;
  start = WriteDigits(start, decimal.millionths, 6);
  *--start = point;
  start = WriteDigits(start, decimal.whole, 1);
  if (negative) *--start = '-';
  return start;
}

void xArgument::SetText(const char* value) {
  kind = kText;
  text.Assign(value);
}

void xArgument::SetInteger(i32 value) {
  kind = kInteger;
  integer = value;
  real = value;
  char number[kNumberSize];
  char* start = number + kNumberSize - 1;
  *start = 0;
  const u32 bits = static_cast<u32>(value);
  start = WriteDigits(start, value < 0 ? 0 - bits : bits, 1);
  if (value < 0) *--start = '-';
  text.Assign(start);
}

void xArgument::SetReal(double value) {
  kind = kReal;
  // The conversion of a value that does not fit is undefined in C++; this is what the processor's
  // own instruction answers. The comparison is false for a value that is not a number.
  const bool fits = value > -2147483649.0 && value < 2147483648.0;
  integer = fits ? static_cast<i32>(value) : INT32_MIN;
  real = value;
  char number[kNumberSize];
  if (const char* const written = WriteReal(value, number))
    text.Assign(written);
  else
    text.Format("%lf", value);
}
