// SPDX-License-Identifier: MIT
#include "Interpreter.h"

#include <signal.h>
#include <wchar.h>

#include "FaultHandler.h"
#include "Interrupter.h"
#include "ProcessStateSnapshot.h"
#include "RubyRuntime.h"
#include "UnwindHandler.h"

namespace {

// A task that the interpreter is running, on its stack; a nested one points to the outer one.
struct Entry {
  RubyTask* task;
  Entry* outer;
  unsigned number;
  bool abandoned = false;
  bool interrupted = false;
  bool interruptible = false;
  bool leaving = false;  // its Ruby code is being unwound
  ProcessStateSnapshot process = {};
};

// What the switching side reports to the other side.
enum class Message { kStart, kBegin, kResume, kFinished, kCall };

// Of x87 and of SSE: rounding, precision and exception masks belong to each side alone.
struct FloatControl {
  unsigned short x87;
  unsigned int sse;
};

constexpr FloatControl kRubyFloatControl = {0x037F, 0x1F80};  // extended precision, all masked

struct State {
  LONG thread = 0;                // the first that asked
  HANDLE threadHandle = nullptr;  // kept: its id may be used again
  void* rubyFiber = nullptr;
  void* hostFiber = nullptr;  // of the latest switch; a host may use fibers itself
  bool started = false;
  Message message = Message::kStart;
  RubyTask* task = nullptr;  // of kBegin
  HostCall* call = nullptr;  // of kCall
  Entry* innermost = nullptr;
  unsigned tasks = 0;  // so far
  EXCEPTION_RECORD fault = {};
  FaultHandler* faultHandler = nullptr;
  // Guards `innermost` and its chain, for Interrupt; changed by the interpreter's thread alone.
  SRWLOCK lock = SRWLOCK_INIT;
};

State state;

FloatControl CurrentFloatControl() {
  FloatControl control;
  asm volatile("fnstcw %0" : "=m"(control.x87));
  asm volatile("stmxcsr %0" : "=m"(control.sse));
  return control;
}

void SetFloatControl(const FloatControl& control) {
  asm volatile("fldcw %0" : : "m"(control.x87));
  asm volatile("ldmxcsr %0" : : "m"(control.sse));
}

// --- Ruby side -----------------------------------------------------------------------------------

void SwitchToHost(Message message) {
  state.message = message;
  state.faultHandler->SetActive(false);
  SwitchToFiber(state.hostFiber);
  state.faultHandler->SetActive(true);
  SetFloatControl(kRubyFloatControl);
}

void SetInnermost(Entry* entry) {
  AcquireSRWLockExclusive(&state.lock);
  state.innermost = entry;
  ReleaseSRWLockExclusive(&state.lock);
}

// CRuby calls abort() when it finds itself broken.
void OnAbort(int) {
  RaiseException(static_cast<DWORD>(STATUS_FATAL_APP_EXIT) | 0x80000000, 0, 0, nullptr);
}

// With the process as a macro may change it.
void RunTask() {
  Entry entry = {state.task, state.innermost, ++state.tasks};
  entry.process.Save();
  signal(SIGABRT, OnAbort);
  SetInnermost(&entry);
  entry.task->Run();
  SetInnermost(entry.outer);
  entry.process.Restore();
}

// Does what the host asks until it resumes the pending call. Without one it never returns.
void Serve(Message answer) {
  for (;;) {
    SwitchToHost(answer);
    if (state.message == Message::kResume) return;
    RunTask();
    answer = Message::kFinished;
  }
}

[[noreturn]] void Land() {
  for (;;) SwitchToFiber(state.hostFiber);
}

// A fault in the interpreter's own code on one of its other threads.
bool IsFaultOfRubyThread(const EXCEPTION_RECORD& fault) {
  return !Interpreter::IsMainThread() && IsRubyThread() && IsRubyCode(fault.ExceptionAddress);
}

// It loses the interpreter as one on the main thread does, as soon as that has come to the task's end.
[[noreturn]] void EndFaultyThread() {
  state.fault = state.faultHandler->ThreadFault();
  Interrupter::StopMainThread();
  EndRubyThread();
}

void CALLBACK RunFiber(void*) {
  FaultHandler handler(state.fault, Land, IsFaultOfRubyThread, EndFaultyThread);
  state.faultHandler = &handler;
  SetFloatControl(kRubyFloatControl);
  state.started = StartRuby();
  Serve(Message::kFinished);
}

// --- Host side -----------------------------------------------------------------------------------

void SwitchToRuby(Message message) {
  const FloatControl control = CurrentFloatControl();
  state.message = message;
  state.hostFiber = GetCurrentFiber();
  SwitchToFiber(state.rubyFiber);
  SetFloatControl(control);
}

// The task of an entry whose frame of Enter is gone, or is about to be.
void Abandon(Entry* entry) {
  RubyTask* const task = entry->task;
  entry->abandoned = true;
  Interrupter::Wake();             // in case its `ensure` blocks do not end by themselves
  SwitchToRuby(Message::kResume);  // ends the task: it can make no further call
  if (!Interpreter::FatalExceptionCode()) delete task;
}

// Inner frames are older victims of the same jump.
void AbandonUpTo(Entry* last) {
  while (state.innermost && !Interpreter::FatalExceptionCode()) {
    Entry* const entry = state.innermost;
    Abandon(entry);
    if (entry == last) break;
  }
}

void OnFrameDiscarded(void* entry) {
  for (Entry* each = state.innermost; each; each = each->outer)
    if (each == entry) return AbandonUpTo(each);
}

// Two interpreters in one process would change the same environment, signals and streams. The name
// is held for as long as the process lives.
bool IsOnlyCopy() {
  static HANDLE mark = nullptr;
  if (mark) return true;
  wchar_t name[64];
  swprintf(name, 64, L"Local\\RubyScript.Interpreter.%lu", GetCurrentProcessId());
  const HANDLE created = CreateMutexW(nullptr, FALSE, name);
  if (created && GetLastError() == ERROR_ALREADY_EXISTS) {
    CloseHandle(created);
    return false;
  }
  mark = created;
  return true;
}

// Ruby's threads and the handler of faults run its code until the process ends.
void PinLibrary() {
  HMODULE module = nullptr;
  GetModuleHandleExW(GET_MODULE_HANDLE_EX_FLAG_PIN | GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS,
                     reinterpret_cast<const wchar_t*>(PinLibrary), &module);
}

// The calling thread becomes the interpreter's if there is none yet.
HRESULT ClaimThread() {
  const LONG caller = static_cast<LONG>(GetCurrentThreadId());
  const LONG owner = InterlockedCompareExchange(&state.thread, caller, 0);
  if (owner == 0)
    state.threadHandle = OpenThread(SYNCHRONIZE | THREAD_TERMINATE, FALSE, GetCurrentThreadId());
  const HANDLE handle = state.threadHandle;
  if (handle && WaitForSingleObject(handle, 0) == WAIT_OBJECT_0) return RPC_E_SERVER_DIED;
  return owner == 0 || owner == caller ? S_OK : RPC_E_WRONG_THREAD;
}

HRESULT CreateRubyFiber() {
  if (!IsThreadAFiber() && !ConvertThreadToFiber(nullptr)) return E_OUTOFMEMORY;
  constexpr SIZE_T kCommitted = 64 * 1024;
  // CRuby's compiler and parts of its library recurse without a check of the stack. Address space is
  // all that this costs until it is used; a host that has little left gets less.
  for (SIZE_T reserved = 64 << 20; !state.rubyFiber && reserved >= 16 << 20; reserved /= 2)
    state.rubyFiber = CreateFiberEx(kCommitted, reserved, 0, RunFiber, nullptr);
  if (!state.rubyFiber) return E_OUTOFMEMORY;
  return S_OK;
}

// Puts the host's state back here, because the code that ran does not run again.
void RestoreHost() {
  Entry* entry = state.innermost;
  while (entry && entry->outer) entry = entry->outer;
  if (entry) entry->process.Restore();
  SetInnermost(nullptr);
}

[[noreturn]] void RaiseFault() {
  RestoreHost();
  const EXCEPTION_RECORD& fault = state.fault;
  RaiseException(fault.ExceptionCode, fault.ExceptionFlags & EXCEPTION_NONCONTINUABLE,
                 fault.NumberParameters, fault.ExceptionInformation);
  __builtin_trap();  // a handler that continues has nothing to go on with
}

}  // namespace

bool Interpreter::HasStarted() { return state.rubyFiber != nullptr; }

DWORD Interpreter::FatalExceptionCode() { return state.fault.ExceptionCode; }

HRESULT Interpreter::Start() {
  if (!IsOnlyCopy()) return kOtherCopy;
  const HRESULT claimed = ClaimThread();
  // CRuby's own threads fail when the interpreter's has ended, which would count as a fault.
  if (claimed == RPC_E_SERVER_DIED) return claimed;
  if (FatalExceptionCode()) return E_ABORT;
  if (FAILED(claimed)) return claimed;
  if (IsRubySide()) return E_UNEXPECTED;
  if (state.rubyFiber) {
    if (!state.started) return E_FAIL;
    return IsThreadAFiber() || ConvertThreadToFiber(nullptr) ? S_OK : E_OUTOFMEMORY;
  }
  const HRESULT result = CreateRubyFiber();
  if (FAILED(result)) return result;
  PinLibrary();
  SwitchToRuby(Message::kStart);
  if (FatalExceptionCode()) RaiseFault();
  return state.started ? S_OK : E_FAIL;
}

HRESULT Interpreter::Enter(RubyTask* task) {
  if (FatalExceptionCode()) return E_ABORT;
  state.task = task;
  SwitchToRuby(Message::kBegin);
  for (;;) {
    if (FatalExceptionCode()) RaiseFault();
    if (state.message == Message::kFinished) return S_OK;
    Entry* const entry = state.innermost;
    {
      UnwindHandler unwindHandler(OnFrameDiscarded, entry);
      state.call->Run();
    }
    // A run that was nested into the call may have lost the interpreter; or a host with fibers of
    // its own has left one there that is not done, and only the innermost can go on.
    if (FatalExceptionCode() || state.innermost != entry) return E_ABORT;
    SwitchToRuby(Message::kResume);
  }
}

// The outermost one: a host function may have called the same macro again.
static Entry* FindEntry(const void* owner) {
  Entry* found = nullptr;
  for (Entry* each = state.innermost; each; each = each->outer)
    if (each->task->owner == owner) found = each;
  return found;
}

void Interpreter::Interrupt(const void* owner) {
  AcquireSRWLockExclusive(&state.lock);
  Entry* const entry = FindEntry(owner);
  // What runs inside of it ends first.
  for (Entry* each = state.innermost; entry && each != entry->outer; each = each->outer)
    each->interrupted = true;
  ReleaseSRWLockExclusive(&state.lock);
  if (entry) Interrupter::Wake();
}

bool Interpreter::IsRunning(const void* owner) {
  AcquireSRWLockExclusive(&state.lock);
  const bool running = FindEntry(owner) != nullptr;
  ReleaseSRWLockExclusive(&state.lock);
  return running;
}

bool Interpreter::CallHost(HostCall& call) {
  if (MustEnd()) return false;
  state.call = &call;
  Serve(Message::kCall);
  return !MustEnd();
}

bool Interpreter::MustEnd() {
  const Entry* const entry = state.innermost;
  return !entry || entry->abandoned || entry->interrupted;
}

bool Interpreter::IsAbandoned() { return state.innermost->abandoned; }

Interpreter::Urgency Interpreter::InterruptDue() {
  const Entry* const entry = state.innermost;
  if (!entry || !entry->interruptible || !MustEnd()) return Urgency::kNone;
  return entry->leaving || entry->abandoned ? Urgency::kAfterGrace : Urgency::kNow;
}

void Interpreter::SetInterruptible(bool value) { state.innermost->interruptible = value; }

void Interpreter::SetLeaving() { state.innermost->leaving = true; }

HANDLE Interpreter::ThreadHandle() { return state.threadHandle; }

bool Interpreter::IsMainThread() { return static_cast<LONG>(GetCurrentThreadId()) == state.thread; }

bool Interpreter::IsRubySide() {
  return IsMainThread() && state.rubyFiber && IsThreadAFiber() &&
         GetCurrentFiber() == state.rubyFiber;
}

const void* Interpreter::Owner() { return state.innermost->task->owner; }

unsigned Interpreter::TaskNumber() { return state.innermost ? state.innermost->number : 0; }
