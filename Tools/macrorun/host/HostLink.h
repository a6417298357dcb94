// SPDX-License-Identifier: MIT
// The adapter between the module and the rest of this program: it implements the host macro
// interface and owns the context record on the module's side of the boundary (Microsoft C++ ABI),
// and shows the program a plain C interface, since the program is compiled in another ABI.
//
// Rules: no exception may leave a callback. A callback returns before the macro is stopped, because
// the stop unwinds by a jump to the module's `execute` and runs no destructor on its way.
// Threading: the thread that calls `execute`, throughout.
#pragma once

#include <stdint.h>

#include "functions/HostArgument.h"

extern "C" {

struct HostLink;

struct HostCallbacks {
  void* context;                                            // first argument of each callback
  void (*report)(void* context, const char* text);          // a message of the module for the user
  void (*trace)(void* context, const char* text);           // a debug line, with its line end
  uint32_t (*functionId)(void* context, const char* name);  // kUnknownId: no such function
  bool (*call)(void* context, uint32_t id);                 // false: the macro is to be stopped
  void (*stopping)(void* context);                          // as `kill` has asked, at a call
};

enum HostStopCause : uint32_t {
  kNotStopped,
  kStoppedByCall,  // `call` asked for it
  kStoppedByUser,  // the module's `kill` had flagged the record
};

// Null when there is no memory. The callbacks are copied.
HostLink* CreateHostLink(const HostCallbacks* callbacks);
void DestroyHostLink(HostLink* link);

// The object to hand to `execute`.
void* HostLinkInterface(HostLink* link);

// The arguments of the call in progress, left to right.
uint32_t HostLinkArgumentCount(HostLink* link);
HostArgument HostLinkArgument(HostLink* link, uint32_t index);

// The result of the call in progress; the integer 0 when none is set. False: no memory.
void HostLinkSetInteger(HostLink* link, int32_t value);
bool HostLinkSetText(HostLink* link, const char* text);

// Whether the last run was stopped by the host, and why.
HostStopCause HostLinkStopCause(HostLink* link);

// Around a run that a call nests into the one in progress: the inner run leaves the record without
// its engine. BeginNested answers what EndNested takes.
struct HostNesting {
  void* engine;
  HostStopCause stopCause;
};
HostNesting HostLinkBeginNested(HostLink* link);
void HostLinkEndNested(HostLink* link, const HostNesting* nesting);
}
