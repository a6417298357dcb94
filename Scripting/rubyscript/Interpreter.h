// SPDX-License-Identifier: MIT
// The one Ruby interpreter of the process. It lives on a fiber of the first thread that needs it:
// the same thread as the host's code, but a separate stack. A host that leaves its frames by a jump
// or a fault therefore discards none of Ruby's.
//
//   host's stack                                interpreter's stack
//   Enter(task)  ------------------------------>  task.Run()
//     call.Run()  <-----------------------------    CallHost(call)
//       ... perhaps Enter(another task)  ------>      another task.Run()
//     returns  -------------------------------->    goes on
//   returns  <----------------------------------  is done
//
// Around each task the host's process state is put back (see ProcessStateSnapshot.h). When the host discards
// the frame of a call, the pending CallHost answers false, the task unwinds its Ruby code (`ensure`
// blocks run, but no further call is made) and is deleted.
//
// Threading: the interpreter's thread, unless said otherwise. "Host side" functions are called on the
// host's stack, "Ruby side" ones on the interpreter's.
// Errors: as given at each function. A fault inside the interpreter leaves it lost for good.
#pragma once

#include <windows.h>

// A piece of work for the interpreter. Allocated with new; Enter says who deletes it.
class RubyTask {
 public:
  explicit RubyTask(const void* taskOwner) : owner(taskOwner) {}
  virtual ~RubyTask() = default;
  RubyTask(const RubyTask&) = delete;
  RubyTask& operator=(const RubyTask&) = delete;
  // Ruby side. No Ruby exception may leave it.
  virtual void Run() = 0;

  const void* const owner;  // what Interrupt names; never used as an address
};

// A call out of the interpreter, made on the host's stack. It lives in a frame of the Ruby side.
class HostCall {
 public:
  virtual void Run() = 0;

 protected:
  ~HostCall() = default;
};

class Interpreter {
 public:
  // Any thread. Once started the interpreter cannot be ended: its DLL stays in the process.
  static bool HasStarted();

  // Host side, any thread. Starts the interpreter when this is the first use. RPC_E_WRONG_THREAD: it
  // lives on another thread. RPC_E_SERVER_DIED: its thread has ended. kOtherCopy: another copy of the
  // engine's DLL runs one in this process. E_UNEXPECTED: the caller runs on the interpreter's stack.
  // E_OUTOFMEMORY: a later try may start it. E_FAIL: it does not start. E_ABORT: lost.
  static HRESULT Start();
  static constexpr HRESULT kOtherCopy = HRESULT_FROM_WIN32(ERROR_ALREADY_EXISTS);
  // Host side, after a successful Start: runs the task and serves its calls. S_OK: it has run and is
  // the caller's to delete; E_ABORT: it cannot go on, and is not the caller's any more. Raises the
  // fault of an interpreter that gets lost, as a structured exception of the same code. If the
  // caller's frame is discarded, the task is deleted.
  static HRESULT Enter(RubyTask* task);
  // Any thread. The exception code that lost the interpreter; 0 while it is whole.
  static DWORD FatalExceptionCode();
  // Any thread. Ends what runs for the owner, and what is nested into it: within a tenth of a second
  // when it is in Ruby code, at the call's return when it is in a call of the host.
  static void Interrupt(const void* owner);
  // Any thread. Whether a task of the owner is under way, perhaps in a call of the host.
  static bool IsRunning(const void* owner);

  // Ruby side. False: the host has discarded the call's frame or asks for the end; then, or when
  // MustEnd answers true, the caller frees what it holds and calls Leave.
  static bool CallHost(HostCall& call);
  // Ruby side. Whether the innermost task is to end without making further calls.
  static bool MustEnd();
  // Ruby side. Whether the host has discarded the innermost task's frame.
  static bool IsAbandoned();
  // Ruby side. Whether the innermost task runs code that Interrupt may end now; false while the
  // engine prepares or tidies. Begins as false with each task.
  static void SetInterruptible(bool value);
  // Ruby side. The innermost task has begun to unwind its Ruby code.
  static void SetLeaving();
  // Ruby side, any thread of Ruby's: whether what runs now is to be interrupted.
  enum class Urgency { kNone, kNow, kAfterGrace };
  static Urgency InterruptDue();
  // Ruby side, any thread of Ruby's. A number that differs for each task; 0 while none runs.
  static unsigned TaskNumber();
  // Ruby side. Of the innermost task.
  static const void* Owner();
  // Any thread. Whether the caller runs on the interpreter's stack, or on one of Ruby's fibers.
  static bool IsRubySide();
  // Ruby side, any thread of Ruby's. Whether this is the thread that may call the host.
  static bool IsMainThread();
  // Any thread. Of the thread that may call the host, to wait for its end or cancel what it reads;
  // null before the first use.
  static HANDLE ThreadHandle();
};
