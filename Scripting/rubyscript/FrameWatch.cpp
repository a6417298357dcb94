// SPDX-License-Identifier: MIT
#include "FrameWatch.h"

#include <stdint.h>

// The thread's chain of handlers begins at the start of its information block.
static void* ChainHead() { return reinterpret_cast<void*>(__readfsdword(0)); }
static void SetChainHead(void* record) { __writefsdword(0, reinterpret_cast<DWORD>(record)); }
static void* const kEmptyChain = reinterpret_cast<void*>(UINT32_MAX);

static constexpr DWORD kUnwinding = EXCEPTION_UNWINDING | EXCEPTION_EXIT_UNWIND;

// --- FrameWatch ----------------------------------------------------------------------------------

FrameWatch::FrameWatch(void (*callback)(void*), void* callbackContext)
    : record{static_cast<HandlerRecord*>(ChainHead()), Handle},
      discarded(callback),
      context(callbackContext) {
  SetChainHead(&record);
}

FrameWatch::~FrameWatch() { SetChainHead(record.next); }

EXCEPTION_DISPOSITION FrameWatch::Handle(EXCEPTION_RECORD* exception, void* frame, CONTEXT*,
                                         void*) {
  if (exception->ExceptionFlags & kUnwinding) {
    FrameWatch& watch = *static_cast<FrameWatch*>(frame);
    watch.discarded(watch.context);
  }
  return ExceptionContinueSearch;
}

// --- FaultBase -----------------------------------------------------------------------------------

static FaultBase* base = nullptr;

FaultBase::FaultBase(EXCEPTION_RECORD& target, void (*landing)(), IsThreadFault isFault,
                     void (*threadEnd)())
    : record{static_cast<HandlerRecord*>(ChainHead()), Handle},
      fault(target),
      land(landing),
      isThreadFault(isFault),
      endThread(threadEnd),
      thread(GetCurrentThreadId()) {
  base = this;
  SetChainHead(&record);
  AddVectoredExceptionHandler(FALSE, HandleUnasked);
}

// Errors and the compilers' language-level exceptions; not messages to a debugger, nor guard pages.
static bool IsFault(DWORD code) { return code >= 0xC0000000; }

bool FaultBase::Take(const EXCEPTION_RECORD& exception, CONTEXT& state) {
  if (!active || !IsFault(exception.ExceptionCode)) return false;
  active = false;
  fault = exception;
  // As after a call instruction.
  state.Esp = reinterpret_cast<DWORD>(landing + sizeof landing - sizeof(void*));
  state.Eip = reinterpret_cast<DWORD>(land);
  SetChainHead(&record);
  return true;
}

EXCEPTION_DISPOSITION FaultBase::Handle(EXCEPTION_RECORD* exception, void*, CONTEXT* context,
                                        void*) {
  if (exception->ExceptionFlags & kUnwinding) return ExceptionContinueSearch;
  return base->Take(*exception, *context) ? ExceptionContinueExecution : ExceptionContinueSearch;
}

// Goes on below the faulting frame, as after a call instruction. One that faults again just ends.
void FaultBase::RedirectThread(const EXCEPTION_RECORD& exception, CONTEXT& state) {
  if (threadFault.ExceptionCode) ExitThread(0);
  threadFault = exception;
  state.Esp = (state.Esp & ~DWORD{15}) - sizeof(void*);
  state.Eip = reinterpret_cast<DWORD>(endThread);
}

// The interpreter's own fibers begin with an empty chain, so no record would be asked.
LONG FaultBase::HandleUnasked(EXCEPTION_POINTERS* exception) {
  const EXCEPTION_RECORD& record = *exception->ExceptionRecord;
  if (IsFault(record.ExceptionCode) && base->isThreadFault(record)) {
    base->RedirectThread(record, *exception->ContextRecord);
    return EXCEPTION_CONTINUE_EXECUTION;
  }
  if (GetCurrentThreadId() != base->thread || ChainHead() != kEmptyChain)
    return EXCEPTION_CONTINUE_SEARCH;
  return base->Take(record, *exception->ContextRecord) ? EXCEPTION_CONTINUE_EXECUTION
                                                       : EXCEPTION_CONTINUE_SEARCH;
}
