// SPDX-License-Identifier: MIT
// A plain model of Array and one of String, each with a program of random steps: the class under test
// takes the same steps as its model, and the two are compared after each one. The steps are read from
// any bytes: the fuzz targets choose those by coverage, core_tests at random.
//
// Each returns the number of steps. Threading: one thread at a time.
#pragma once

#include <fuzzer/FuzzedDataProvider.h>

#include <string>

#include "cLib/cString.h"
#include "cLib/cTypes.h"

using Input = FuzzedDataProvider;

size_t ArrayModel(Input& input);
size_t StringModel(Input& input);

// Each program has its own way to fail.
[[noreturn]] void ModelFailed(const char* file, int line, const char* condition);
#define CHECK(condition)                                           \
  do {                                                             \
    if (!(condition)) ModelFailed(__FILE__, __LINE__, #condition); \
  } while (false)

// The n-th allocation from now fails (1: the next one; 0: none does). Returns whether the one of
// the last call has failed.
bool FailAllocation(int n);

// What a container holds: it knows how many of its kind live.
struct Element {
  static inline int live = 0;
  int id;
  explicit Element(int number = 0) : id(number) { ++live; }
  Element(const Element&) = delete;
  Element& operator=(const Element&) = delete;
  virtual ~Element() { --live; }
};

inline std::string Bytes(const String& s) { return {s.Text(), s.Length()}; }

inline u32 Below(Input& input, u32 limit) { return input.ConsumeIntegralInRange(0u, limit - 1); }

// Without zero bytes; mostly characters that mean something to somebody, or whatever comes.
char AnyCharacter(Input& input);
std::string AnyText(Input& input, u32 longest = 16);
// One of `size` places, one near them, or an extreme one.
int AnyPlace(Input& input, size_t size);
