// SPDX-License-Identifier: MIT
// The stop mechanism: the module's one jump buffer, armed by `execute`, and the operation that
// unwinds to it.
//
// A stop always reaches the innermost armed `execute`: each one saves the stop point on entry and
// puts it back when it ends, so a nested run never leaves the buffer pointing into its dead frame.
//
// Threading: a stop works on the host thread inside `execute` only, from within a call that the script
// made into the host; on other threads it is reported. Nothing of the module's own in the frames
// between is destroyed; handlers that other frames have registered with the system do run.
#pragma once

#include <setjmp.h>

#include "cLib/cTypes.h"

struct StopPoint {
  jmp_buf buffer;
  u32 thread;  // that has armed it
  bool armed;
};

StopPoint& CurrentStopPoint();

// Whether another thread than the calling one is inside the armed `execute`.
bool IsOtherThreadArmed();

// Traces "stop_macro" and jumps to the armed `execute` with the value -1. Returns only when this
// thread has armed none, which is reported (source "cScript").
void StopMacro();
