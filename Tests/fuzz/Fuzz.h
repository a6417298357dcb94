// SPDX-License-Identifier: MIT
// What the fuzz targets share: the choice of an input's bytes, elements for containers, and a check
// that names its place.
#pragma once

#include <fuzzer/FuzzedDataProvider.h>
#include <stdio.h>

#include <string>

#include "cLib/cString.h"

using Input = FuzzedDataProvider;

#define CHECK(condition)                                              \
  do {                                                                \
    if (!(condition)) {                                               \
      fprintf(stderr, "%s:%d: %s\n", __FILE__, __LINE__, #condition); \
      __builtin_trap();                                               \
    }                                                                 \
  } while (false)

// A text without zero bytes.
inline std::string AnyText(Input& input, size_t longest = 64) {
  std::string text = input.ConsumeRandomLengthString(longest);
  return text.substr(0, text.find('\0'));
}

// One of `size` places, one near them, or an extreme one.
inline int AnyPlace(Input& input, size_t size) {
  const int place = input.ConsumeIntegralInRange<int>(-3, 1000);
  if (place == -2) return INT32_MIN;
  if (place == -3) return INT32_MAX;
  return place < 0 ? place : place % static_cast<int>(size + 3);
}

// What a container holds: it knows how many of its kind live.
struct Element {
  static inline int live = 0;
  Element() { ++live; }
  Element(const Element&) = delete;
  Element& operator=(const Element&) = delete;
  virtual ~Element() { --live; }
};

inline std::string BytesOf(const String& s) { return {s.Text(), s.Length()}; }
