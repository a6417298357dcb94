// SPDX-License-Identifier: MIT
// Two records for the system's chain of exception handlers, in assembler's reach only on 32-bit x86:
// one tells that a frame of the host's stack was discarded, the other keeps a fault on the
// interpreter's stack from ending the process. Both are plain members of a frame: they work for
// structured exceptions and for the C library's longjmp, which unwinds the same chain.
//
// Threading: a record belongs to the thread and the stack it was made on.
#pragma once

#include <windows.h>

// As the system defines it.
struct HandlerRecord {
  HandlerRecord* next;
  EXCEPTION_DISPOSITION(__cdecl* handle)(EXCEPTION_RECORD* record, void* frame, CONTEXT* context,
                                         void* dispatcher);
};

// Calls `discarded(context)` when its frame is left by a fault that an outer frame has caught, or by
// a jump. The call is made on top of the discarded frames, before they are gone; it must return.
class FrameWatch {
 public:
  FrameWatch(void (*discarded)(void*), void* context);
  ~FrameWatch();
  FrameWatch(const FrameWatch&) = delete;
  FrameWatch& operator=(const FrameWatch&) = delete;

 private:
  static EXCEPTION_DISPOSITION __cdecl Handle(EXCEPTION_RECORD* record, void* frame,
                                              CONTEXT* context, void* dispatcher);
  HandlerRecord record;  // first: the chain's records are found by their own address
  void (*discarded)(void*);
  void* context;
};

// The outermost frame of the interpreter's stack. A fault that nothing above it handles is copied
// to `fault`, and the thread goes on in `land`, on a piece of this frame; all above it is never run
// again, but stays as it was. Also takes faults on stacks that the interpreter made itself, whose
// chains are empty.
class FaultBase {
 public:
  // Asked of every fault on any thread; true: one of another thread that the interpreter has
  // made. That thread then goes on in `endThread`, which must not return.
  using IsThreadFault = bool (*)(const EXCEPTION_RECORD& fault);

  // One in a process. `land` must not return.
  FaultBase(EXCEPTION_RECORD& fault, void (*land)(), IsThreadFault isThreadFault,
            void (*endThread)());
  FaultBase(const FaultBase&) = delete;
  FaultBase& operator=(const FaultBase&) = delete;

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
