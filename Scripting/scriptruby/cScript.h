// SPDX-License-Identifier: MIT
// The module's three exports. The host editor loads the module by name and calls them with the
// standard Windows calling convention; Docs/abi.md is their description for host developers.
//
// Errors: plain integers and one-byte booleans. Every fault is caught: no export throws.
// Threading: `execute` and `version` on the host thread; `kill` from any thread.
//
// Next on the reader's path: Core/cLib/cHost.h, the host's contract.
#pragma once

#include "cLib/cTypes.h"

class HostInterface;
struct ScriptInfoRecord;

extern "C" {
// Runs one macro file (full path, system ANSI code page) for `host`, which stays the host's. 1 for
// success, 0 for a failed parse or run, -1 when there was nothing to run, the run was stopped, or a
// fault was caught. May be called again from inside a run.
i32 __stdcall execute(const char* file, HostInterface* host);

// Flags the running macro: the context record's stop fields receive 1 and `value`. False when no run
// is active or the record cannot be written. The host acts on the flag.
bool __stdcall kill(i32 value);

// Fills the caller's record, whose header must carry its size (392) and layout version (77 or 0).
// `hostPath` is the host's data folder, null for none. False, after a message box, when the size is
// wrong or the record could not be filled, after a fault for example.
bool __stdcall version(ScriptInfoRecord* record, const char* hostPath);
}
