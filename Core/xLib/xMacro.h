// SPDX-License-Identifier: MIT
// The macro engine as `execute`, `version` and the host editor see it: a table of operations. The
// host reaches it through the context record's engine field, so the slot order is fixed.
//
// Ownership: an engine belongs to the call that created it and ends through Destroy() only.
// Threading: the host thread only.
//
// Next on the reader's path: xMacroWSH, the Windows Script Host implementation.
#pragma once

#include "cLib/cHost.h"
#include "cLib/cSlots.h"

struct ScriptInfoRecord;

class xMacro {
 public:
  SLOTS_FROM(0);
  // The engine's own number for a function name: it has none.
  SLOT(0) u32 FunctionId(const char* /*name*/) { return kUnknownFunction; }
  // Interrupts the running script and unwinds to `execute`; does not return while one is armed.
  // Only from within a call that the script made into the host; on another thread it is reported.
  SLOT(1) void Stop() = 0;
  SLOT(2) void Initialise() = 0;
  // Frees the engine.
  SLOT(3) void Destroy() = 0;
  // 1 when the macro file was parsed and run, 0 when that failed, -1 when it could not be tried.
  SLOT(4) i32 Run(const char* file) = 0;
  // Fills a zeroed record with the language description; `hostPath` is the host's data folder.
  SLOT(5) bool FillVersion(ScriptInfoRecord* record, const char* hostPath) = 0;

 protected:
  // The destructor takes slot 6 in the derived classes.
  ~xMacro() = default;
};
