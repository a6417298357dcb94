// SPDX-License-Identifier: MIT
#include "cLib/cStop.h"

#include "cLib/cHost.h"
#include "cLib/cReport.h"

static StopPoint stopPoint;

StopPoint& CurrentStopPoint() { return stopPoint; }

void StopMacro() {
  TraceTo(CurrentHost(), "stop_macro");
  if (!stopPoint.armed) {
    REPORT_ASSERT("cScript", "Stop without a run to stop");
    return;
  }
  longjmp(stopPoint.buffer, -1);
}
