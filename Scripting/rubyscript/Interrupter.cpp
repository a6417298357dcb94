// SPDX-License-Identifier: MIT
#include "Interrupter.h"

#include "Interpreter.h"
// Last: they rename what the headers above use.
#include "RubyCall.h"
#include "RubyInternals.h"
#include <ruby.h>
#include <ruby/debug.h>
#include <ruby/thread.h>

namespace {

// A fault by the rules of the host's guard: an error, of a customer's own.
constexpr DWORD kUnstoppable = 0xE0525542;

HANDLE wakeEvent = nullptr;   // made once, before the first macro
VALUE mainThread = Qnil;
bool waiting = false;  // the thread has come to its first wait

constexpr DWORD kGrace = 500;  // milliseconds for `ensure` blocks

// When the exception has been of no use, as in a loop whose `ensure` block ends in `next`, the code is
// left at each of its lines; when that has been of no use so many times, the interpreter is given up.
constexpr int kMostLeaves = 1000;
bool delivering = false;
int deliveries = 0;
int leaves = 0;

void* WaitOutside(void* milliseconds) {
  WaitForSingleObject(wakeEvent, *static_cast<DWORD*>(milliseconds));
  return nullptr;
}

void EndWait(void*) { SetEvent(wakeEvent); }

void Wait(DWORD milliseconds) {
  rb_thread_call_without_gvl(WaitOutside, &milliseconds, EndWait, nullptr);
}

VALUE CheckInterrupts(VALUE) {
  rb_thread_check_ints();
  return Qnil;
}

VALUE LetOthersRun(VALUE) {
  rb_thread_schedule();  // checks for interrupts, too
  return Qnil;
}

void OnEvent(rb_event_flag_t, VALUE, VALUE, ID, VALUE) {
  if (!Interpreter::IsMainThread() || Interpreter::InterruptDue() == Interpreter::Urgency::kNone)
    return;
  if (++leaves > kMostLeaves) RaiseException(kUnstoppable, 0, 0, nullptr);
  VALUE ignored;
  Protect(CheckInterrupts, Qnil, ignored);  // the exception is not needed any more
  LeaveTask();
}

// As Thread#raise, without the events of a call: the macro may trace those.
VALUE RaiseOnMainThread(VALUE) {
  void* const thread = RTYPEDDATA_DATA(mainThread);
  rb_threadptr_pending_interrupt_enque(thread, rb_obj_alloc(StopClass()));
  rb_threadptr_interrupt(thread);
  return Qnil;
}

// CRuby reads standard input in a call of the system that its own interrupts do not end. The lock of
// the interpreter is held here, so the thread is not in a call of the host.
VALUE Deliver(VALUE) {
  if (++deliveries == 2)
    rb_add_event_hook(OnEvent, RUBY_EVENT_LINE | RUBY_EVENT_CALL | RUBY_EVENT_B_CALL, Qnil);
  RaiseOnMainThread(Qnil);
  CancelSynchronousIo(Interpreter::ThreadHandle());
  return Qnil;
}

// Threads may switch between the look and the exception; Settle lets this come to its end first.
void DeliverIfDue() {
  delivering = true;
  VALUE ignored;
  if (Interpreter::InterruptDue() != Interpreter::Urgency::kNone) Protect(Deliver, Qnil, ignored);
  delivering = false;
}

// All of it, however often it is woken meanwhile, unless another task runs by then.
void WaitGrace(unsigned task) {
  const DWORD start = GetTickCount();
  for (DWORD past = 0; past < kGrace && Interpreter::TaskNumber() == task;
       past = GetTickCount() - start)
    Wait(kGrace - past);
}

VALUE Interrupt(void*) {
  waiting = true;
  for (;;) {
    Wait(INFINITE);
    while (Interpreter::InterruptDue() != Interpreter::Urgency::kNone) {
      const unsigned task = Interpreter::TaskNumber();
      if (Interpreter::InterruptDue() == Interpreter::Urgency::kAfterGrace) WaitGrace(task);
      if (Interpreter::TaskNumber() != task) continue;  // the grace was another one's
      DeliverIfDue();
      WaitGrace(task);
    }
  }
}

}  // namespace

static VALUE CreateRubyThread(VALUE, VALUE, int, const VALUE*, VALUE) {
  return rb_thread_create(Interrupt, nullptr);
}

void Interrupter::EnsureStarted() {
  if (waiting) return;
  wakeEvent = CreateEventW(nullptr, FALSE, FALSE, nullptr);
  if (!wakeEvent) return;  // tried again by the next macro
  mainThread = rb_thread_current();
  rb_gc_register_mark_object(mainThread);
  // The thread inherits the mask: a macro that finds it can neither end it nor raise anything in it.
  VALUE mask = rb_hash_new();
  rb_hash_aset(mask, rb_cObject, ID2SYM(rb_intern("never")));
  const VALUE thread =
      rb_block_call(rb_cThread, rb_intern("handle_interrupt"), 1, &mask, CreateRubyThread, Qnil);
  while (!waiting) rb_thread_schedule();  // else a macro could be slow to let it start
  // Else it waits for the end of the macro's time slice when it is due.
  rb_funcall(thread, rb_intern("priority="), 1, INT2FIX(3));
  const VALUE group = rb_class_new_instance(0, nullptr, rb_path2class("ThreadGroup"));
  rb_funcall(group, rb_intern("add"), 1, thread);
  rb_funcall(ActiveScriptModule(), rb_intern("interrupter="), 1, thread);
}

void Interrupter::StopMainThread() {
  VALUE ignored;
  Protect(RaiseOnMainThread, Qnil, ignored);
}

void Interrupter::Settle() {
  rb_remove_event_hook(OnEvent);
  deliveries = 0;
  leaves = 0;
  VALUE ignored;
  constexpr int kMostTries = 1000;  // threads of the macro's may have raised something as well
  for (int i = 0; i < kMostTries; ++i) {
    const auto check = delivering ? LetOthersRun : CheckInterrupts;
    if (Protect(check, Qnil, ignored) == Outcome::kDone && !delivering) break;
  }
}

void Interrupter::Wake() {
  if (wakeEvent) SetEvent(wakeEvent);
}
