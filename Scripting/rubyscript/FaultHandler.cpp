// SPDX-License-Identifier: MIT
#include "FaultHandler.h"

static FaultHandler* installed = nullptr;

FaultHandler::FaultHandler(EXCEPTION_RECORD& target, void (*landing)(), IsThreadFault isFault,
                           void (*threadEnd)())
    : record{static_cast<HandlerRecord*>(ChainHead()), Handle},
      fault(target),
      land(landing),
      isThreadFault(isFault),
      endThread(threadEnd),
      thread(GetCurrentThreadId()) {
  installed = this;
  SetChainHead(&record);
  AddVectoredExceptionHandler(FALSE, HandleUnasked);
}

// Errors and the compilers' language-level exceptions; not messages to a debugger, nor guard pages.
static bool IsFault(DWORD code) { return code >= 0xC0000000; }

bool FaultHandler::Take(const EXCEPTION_RECORD& exception, CONTEXT& state) {
  if (!active || !IsFault(exception.ExceptionCode)) return false;
  active = false;
  fault = exception;
  // As after a call instruction.
  state.Esp = reinterpret_cast<DWORD>(landing + sizeof landing - sizeof(void*));
  state.Eip = reinterpret_cast<DWORD>(land);
  SetChainHead(&record);
  return true;
}

EXCEPTION_DISPOSITION FaultHandler::Handle(EXCEPTION_RECORD* exception, void*, CONTEXT* context,
                                           void*) {
  if (exception->ExceptionFlags & kUnwindingFlags) return ExceptionContinueSearch;
  return installed->Take(*exception, *context) ? ExceptionContinueExecution
                                               : ExceptionContinueSearch;
}

// Goes on below the faulting frame, as after a call instruction. One that faults again just ends.
void FaultHandler::RedirectThread(const EXCEPTION_RECORD& exception, CONTEXT& state) {
  if (threadFault.ExceptionCode) ExitThread(0);
  threadFault = exception;
  state.Esp = (state.Esp & ~DWORD{15}) - sizeof(void*);
  state.Eip = reinterpret_cast<DWORD>(endThread);
}

// The interpreter's own fibers begin with an empty chain, so no record would be asked.
LONG FaultHandler::HandleUnasked(EXCEPTION_POINTERS* exception) {
  const EXCEPTION_RECORD& record = *exception->ExceptionRecord;
  if (IsFault(record.ExceptionCode) && installed->isThreadFault(record)) {
    installed->RedirectThread(record, *exception->ContextRecord);
    return EXCEPTION_CONTINUE_EXECUTION;
  }
  if (GetCurrentThreadId() != installed->thread || ChainHead() != EmptyChain())
    return EXCEPTION_CONTINUE_SEARCH;
  return installed->Take(record, *exception->ContextRecord) ? EXCEPTION_CONTINUE_EXECUTION
                                                            : EXCEPTION_CONTINUE_SEARCH;
}
