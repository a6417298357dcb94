// SPDX-License-Identifier: MIT
// Values as a script engine may hand them over: of every type number there is, with and without the
// by-reference, array and vector flags, and all that they point to.
#pragma once

#include <windows.h>
// clang-format off
#include <oleauto.h>
// clang-format on

#include <functional>
#include <random>

class RandomValue {
 public:
  explicit RandomValue(std::mt19937& numbers);
  ~RandomValue();  // frees what the value points to
  RandomValue(const RandomValue&) = delete;
  RandomValue& operator=(const RandomValue&) = delete;

  VARIANT value = {};

  // Whether the host gets it as an argument, and whether this argument of the host's record is it; of
  // what the system converts only the type.
  bool Passes() const { return value.vt != VT_EMPTY && value.vt != VT_DISPATCH; }
  bool Is(void* argument) const;

  // Called when somebody asks one of the objects for its value.
  static inline std::function<void()> onAsked;
  static inline int objectReferences = 0;  // to all objects

 private:
  // Makes what `type`, without the by-reference flag, says at `place`, which has room for a value.
  void Fill(VARTYPE type, void* place);
  VARTYPE Type();
  BSTR Text();
  unsigned Below(unsigned n) { return random() % n; }

  std::mt19937& random;
  VARIANT target = {};  // of a value by reference
  VARIANT inner = {};   // of a variant by reference
};
