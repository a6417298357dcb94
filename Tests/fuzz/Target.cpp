// SPDX-License-Identifier: MIT
// The program of one model, MODEL, whose steps are what the fuzzer comes up with.
#include <stdio.h>

#include "../models/Model.h"

void ModelFailed(const char* file, int line, const char* condition) {
  fprintf(stderr, "%s:%d: %s\n", file, line, condition);
  __builtin_trap();
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* bytes, size_t size) {
  Input input(bytes, size);
  MODEL(input);
  CHECK(Element::live == 0);
  return 0;
}
