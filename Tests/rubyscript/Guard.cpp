// SPDX-License-Identifier: MIT
// The host's guard against faults: the compiler has __try only for the Microsoft ABI.
#include <windows.h>

extern "C" unsigned long CallGuarded(void (*body)(void* context), void* context) {
  __try {
    body(context);
  } __except (EXCEPTION_EXECUTE_HANDLER) {
    return GetExceptionCode();
  }
  return 0;
}
