// SPDX-License-Identifier: MIT
#include "iLib/iGuard.h"

#include <malloc.h>
#include <windows.h>

// A pending exception would fault again at the host's next floating-point instruction, and values that
// the skipped frames left on the unit's stack would make it overflow. The C runtime's _clearfp waits
// for pending exceptions itself.
static void ClearFloatingPoint() { __asm fnclex __asm emms }

// The compiler guards calls, not instructions: the body stays a separate function.
bool RunGuarded(void (*body)(void* context), void* context) {
  __try {
    body(context);
  } __except (EXCEPTION_EXECUTE_HANDLER) {
    ClearFloatingPoint();
    if (GetExceptionCode() == EXCEPTION_STACK_OVERFLOW) _resetstkoflw();
    return false;
  }
  return true;
}
