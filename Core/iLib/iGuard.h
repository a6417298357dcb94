// SPDX-License-Identifier: MIT
// The structured-exception guard: the one place where a fault of the host, the script engine or a
// broken record is caught.
#pragma once

// Calls body(context). False when a structured exception of any kind ended it: access violation,
// stack overflow (the stack's guard page is put back, so that the next overflow is caught again),
// or an unhandled language-level exception. The floating-point unit is left without pending
// exceptions and with an empty stack, its settings unchanged. Nothing of the module's own
// in the frames that it skips is destroyed; handlers that other frames have registered with the
// system do run.
bool RunGuarded(void (*body)(void* context), void* context);
