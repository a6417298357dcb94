// SPDX-License-Identifier: MIT
// COM results and values in tests.
#pragma once

#include <windows.h>
// oleauto.h must come after windows.h.
#include <oleauto.h>

#include <cstdio>
#include <cstring>
#include <string>

inline std::string Hex(HRESULT result) {
  char text[16];
  std::snprintf(text, sizeof text, "%08lX", static_cast<unsigned long>(result));
  return text;
}

// A value of any type by its bits.
template <class T>
VARIANT Value(VARTYPE type, T bits) {
  VARIANT value = {};
  static_assert(sizeof bits <= 8);
  std::memcpy(&value.llVal, &bits, sizeof bits);
  value.vt = type;
  return value;
}
