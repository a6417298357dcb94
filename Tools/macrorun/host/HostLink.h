// SPDX-License-Identifier: MIT
// The adapter between the module and the rest of this program. It implements the host macro
// interface and owns the context record, both in the Microsoft C++ ABI. The program uses it through
// a C interface, because it is compiled for another ABI.
//
// Rules: no exception may leave a callback. A callback returns before the macro is stopped, because
// the stop jumps to the module's `execute` and runs no destructor.
// Threading: the thread that calls `execute`.
#pragma once

#include <stdint.h>

#include "functions/HostArgument.h"

extern "C" {

struct HostLink;

struct HostCallbacks {
  void* context;                                            // first argument of each callback
  void (*report)(void* context, const char* text);          // a report of the module for the user
  void (*trace)(void* context, const char* text);           // a debug line, with its line end
  uint32_t (*functionId)(void* context, const char* name);  // kUnknownId: no such function
  bool (*call)(void* context, uint32_t id);                 // false: stop the macro
  void (*stopping)(void* context);                          // a call stops the macro after `kill`
};

enum HostStopCause : uint32_t {
  kNotStopped,
  kStoppedByCall,  // `call` returned false
  kStoppedByUser,  // the module's `kill` has flagged the record
};

// Null when there is no memory. Copies the callbacks.
HostLink* CreateHostLink(const HostCallbacks* callbacks);
void DestroyHostLink(HostLink* link);

// The object to pass to `execute`.
void* HostLinkInterface(HostLink* link);

// The arguments of the call in progress, left to right.
uint32_t HostLinkArgumentCount(HostLink* link);
HostArgument HostLinkArgument(HostLink* link, uint32_t index);

// The result of the call in progress; the integer 0 when none is set. False: no memory.
void HostLinkSetInteger(HostLink* link, int32_t value);
bool HostLinkSetText(HostLink* link, const char* text);

// Whether the last run was stopped by the host, and why.
HostStopCause HostLinkStopCause(HostLink* link);

// Enclose a run inside a call of another run. They restore the record's engine, which the inner run
// clears.
struct HostNesting {
  void* engine;
  HostStopCause stopCause;
};
HostNesting HostLinkBeginNested(HostLink* link);
void HostLinkEndNested(HostLink* link, const HostNesting* nesting);
}
