// SPDX-License-Identifier: MIT
#include "xLib/xArgument.h"

#include <fenv.h>
#include <locale.h>
#include <string.h>

// A number being written from its end, so that the text can be made at its full size at once.
struct RealParts;
class NumberText {
 public:
  explicit NumberText(i32 value);
  explicit NumberText(const RealParts& value);
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

// A real, taken apart by its bits: floating-point instructions could raise an exception that the
// host has unmasked, and they round to the precision that it has set.
struct RealParts {
  static constexpr int kFractionBits = 44;
  static constexpr u64 kOne = u64{1} << kFractionBits;

  explicit RealParts(u64 bits);

  bool negative;
  bool fits;     // the size is below 2^31; else there are no parts
  u32 whole;     // of the size
  u64 fraction;  // of the size, in units of 1 / kOne, cut off there
};

static u64 ShiftRight(u64 value, int bits) { return bits < 64 ? value >> bits : 0; }

RealParts::RealParts(u64 bits) : whole(0), fraction(0) {
  const int exponent = static_cast<int>(bits >> 52 & 0x7FF);
  const u64 hidden = u64{exponent != 0} << 52;
  const u64 mantissa = (bits & ((u64{1} << 52) - 1)) | hidden;
  const int places = 1075 - (exponent ? exponent : 1);  // of the mantissa, after the binary point
  negative = bits >> 63 != 0;
  fits = places > 21;
  if (!fits) return;
  whole = static_cast<u32>(ShiftRight(mantissa, places));
  fraction = places > kFractionBits ? ShiftRight(mantissa, places - kFractionBits)
                                    : mantissa << (kFractionBits - places);
  fraction &= kOne - 1;
}

// Rounds to six decimals. False next to a tie, where the C runtime decides: one that rounds to 17
// digits first is off by up to 1/20 of the sixth decimal, what `fraction` lacks is far less.
static bool RoundToMillionths(const RealParts& parts, u32& whole, u32& millionths) {
  if (!parts.fits) return false;
  const u64 product = parts.fraction * 1000000;
  const u64 rest = product & (RealParts::kOne - 1);
  constexpr u64 kSixteenth = RealParts::kOne / 16;
  if (rest > 7 * kSixteenth && rest < 9 * kSixteenth) return false;
  const u64 rounded = (product >> RealParts::kFractionBits) + (rest > RealParts::kOne / 2);
  millionths = static_cast<u32>(rounded) % 1000000;
  whole = parts.whole + static_cast<u32>(rounded) / 1000000;
  return true;
}

// The decimal point that the C runtime writes; 0 when it is no single character.
static char DecimalPoint() {
  const char* const point = localeconv()->decimal_point;
  return point[0] && !point[1] ? point[0] : '\0';
}

NumberText::NumberText(const RealParts& value) {
  const char point = DecimalPoint();
  u32 whole = 0;
  u32 millionths = 0;
  if (!point || !RoundToMillionths(value, whole, millionths)) return;
  PrependDigits(millionths, 6);
  Prepend(point);
  PrependDigits(whole, 1);
  if (value.negative) Prepend('-');
}

// The conversion of a value that does not fit is undefined in C++; this is what the processor's own
// instruction answers.
static i32 Truncated(const RealParts& value) {
  if (!value.fits) return INT32_MIN;
  const i32 size = static_cast<i32>(value.whole);
  return value.negative ? -size : size;
}

// Its argument is the bits of a real: loading a real can raise an exception and change it.
static void Format(String& text, const char* format, ...) {
  va_list bits;
  va_start(bits, format);
  text.FormatV(format, bits);
  va_end(bits);
}

// By the C runtime, whose floating-point exceptions the host does not see.
static void FormatReal(String& text, u64 bits) {
  fenv_t environment;
  feholdexcept(&environment);
  Format(text, "%lf", bits);
  fesetenv(&environment);
}

xArgument::xArgument(i32 value)
    : kind(kInteger), integer(value), real(value), text(NumberText(value).Text()) {}

xArgument::xArgument(u64 bits) : xArgument(bits, RealParts(bits)) {}

xArgument::xArgument(u64 bits, const RealParts& parts)
    : kind(kReal), integer(Truncated(parts)), text(NumberText(parts).Text()) {
  memcpy(&real, &bits, sizeof real);
  if (text.IsEmpty()) FormatReal(text, bits);
}
