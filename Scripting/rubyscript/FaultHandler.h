// SPDX-License-Identifier: MIT
// Keeps a fault on the interpreter's stack from ending the process.
#pragma once

#include "HandlerChain.h"

// The outermost frame of the interpreter's stack. A fault that nothing above it handles is copied
// to `fault`, and the thread goes on in `land`, on a piece of this frame; all above it is never run
// again, but stays as it was. Also takes faults on stacks that the interpreter made itself, whose
// chains are empty.
class FaultHandler {
 public:
  // Asked of every fault on any thread; true: one of another thread that the interpreter has
  // made. That thread then goes on in `endThread`, which must not return.
  using IsThreadFault = bool (*)(const EXCEPTION_RECORD& fault);

  // One in a process. `land` must not return.
  FaultHandler(EXCEPTION_RECORD& fault, void (*land)(), IsThreadFault isThreadFault,
               void (*endThread)());
  FaultHandler(const FaultHandler&) = delete;
  FaultHandler& operator=(const FaultHandler&) = delete;

  // Whether the thread runs on the interpreter's side; outside of it nothing is taken.
  void SetActive(bool value) { active = value; }
  // Of another thread; its code is 0 while there was none.
  const EXCEPTION_RECORD& ThreadFault() const { return threadFault; }

 private:
  static EXCEPTION_DISPOSITION __cdecl Handle(EXCEPTION_RECORD* record, void* frame,
                                              CONTEXT* context, void* dispatcher);
  static LONG CALLBACK HandleUnasked(EXCEPTION_POINTERS* exception);
  void RedirectThread(const EXCEPTION_RECORD& record, CONTEXT& context);
  bool Take(const EXCEPTION_RECORD& record, CONTEXT& context);

  HandlerRecord record;
  EXCEPTION_RECORD& fault;
  EXCEPTION_RECORD threadFault = {};
  void (*land)();
  IsThreadFault isThreadFault;
  void (*endThread)();
  DWORD thread;
  bool active = true;
  alignas(16) char landing[4096];  // the stack of `land`
};
