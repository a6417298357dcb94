// SPDX-License-Identifier: MIT
#include "cLib/cStop.h"

#include "cLib/cCompat.h"
#include "cLib/cHost.h"
#include "cLib/cReport.h"

static StopPoint stopPoint;

StopPoint& CurrentStopPoint() { return stopPoint; }

bool IsOtherThreadArmed() { return stopPoint.armed && stopPoint.thread != CurrentThread(); }

void StopMacro() {
  // The host's operations belong to its own thread: no trace here.
  if (IsOtherThreadArmed()) {
    REPORT_ASSERT("cScript", "Stop from a thread that runs no macro");
    return;
  }
  TraceTo(CurrentHost(), "stop_macro");
  if (!stopPoint.armed) {
    REPORT_ASSERT("cScript", "Stop without a run to stop");
    return;
  }
  longjmp(stopPoint.buffer, -1);
}
