// SPDX-License-Identifier: MIT
#include "iLib/iGuard.h"

#include <malloc.h>
#include <windows.h>

// The compiler guards calls, not instructions: the body stays a separate function.
bool RunGuarded(void (*body)(void* context), void* context) {
  __try {
    body(context);
  } __except (EXCEPTION_EXECUTE_HANDLER) {
    if (GetExceptionCode() == EXCEPTION_STACK_OVERFLOW) _resetstkoflw();
    return false;
  }
  return true;
}
