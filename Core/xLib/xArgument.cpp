// SPDX-License-Identifier: MIT
#include "xLib/xArgument.h"

#include <locale.h>

// A number being written from its end, so that the text can be made at its full size at once.
class NumberText {
 public:
  explicit NumberText(i32 value);
  explicit NumberText(double value);
  NumberText(const NumberText&) = delete;
  NumberText& operator=(const NumberText&) = delete;

  const char* Text() const { return start; }  // empty when the C runtime has to write it

 private:
  void Prepend(char ch) { *--start = ch; }
  void PrependDigits(u32 value, int least);

  char characters[24] = "";  // a whole number of 32 bits, a sign, a point and six decimals
  char* start = characters + sizeof characters - 1;
};

// At least `least` digits.
void NumberText::PrependDigits(u32 value, int least) {
  for (; value != 0 || least > 0; value /= 10, --least)
    Prepend(static_cast<char>('0' + value % 10));
}

NumberText::NumberText(i32 value) {
  const u32 bits = static_cast<u32>(value);
  PrependDigits(value < 0 ? 0 - bits : bits, 1);
  if (value < 0) Prepend('-');
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

NumberText::NumberText(double value) {
  const bool negative = value < 0 || (value == 0 && 1 / value < 0);
  const char point = DecimalPoint();
  Decimal decimal;
  if (!point || !Round(negative ? -value : value, decimal)) return;
  PrependDigits(decimal.millionths, 6);
  Prepend(point);
  PrependDigits(decimal.whole, 1);
  if (negative) Prepend('-');
}

// The conversion of a value that does not fit is undefined in C++; this is what the processor's own
// instruction answers. The comparison is false for a value that is not a number.
static i32 Truncated(double value) {
  const bool fits = value > -2147483649.0 && value < 2147483648.0;
  return fits ? static_cast<i32>(value) : INT32_MIN;
}

xArgument::xArgument(i32 value)
    : kind(kInteger), integer(value), real(value), text(NumberText(value).Text()) {}

xArgument::xArgument(double value)
    : kind(kReal), integer(Truncated(value)), real(value), text(NumberText(value).Text()) {
  if (text.IsEmpty()) text.Format("%lf", value);
}
