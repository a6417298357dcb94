// SPDX-License-Identifier: MIT
// A handler record that notices when its frame is unwound by a fault or a jump.
#pragma once

#include "HandlerChain.h"

// Calls `discarded(context)` when its frame is left by a fault that an outer frame has caught, or by
// a jump. The call is made on top of the discarded frames, before they are gone; it must return.
class UnwindHandler {
 public:
  UnwindHandler(void (*discarded)(void*), void* context);
  ~UnwindHandler();
  UnwindHandler(const UnwindHandler&) = delete;
  UnwindHandler& operator=(const UnwindHandler&) = delete;

 private:
  static EXCEPTION_DISPOSITION __cdecl Handle(EXCEPTION_RECORD* record, void* frame,
                                              CONTEXT* context, void* dispatcher);
  HandlerRecord record;  // first: the chain's records are found by their own address
  void (*discarded)(void*);
  void* context;
};
