// SPDX-License-Identifier: MIT
#include "Interrupter.h"

#include "Interpreter.h"
#include "RubyCall.h"
// Last: it renames what the headers above use.
#include <ruby.h>
#include <ruby/debug.h>
#include <ruby/thread.h>

namespace {

HANDLE wakeEvent = nullptr;  // made once, before the first macro
VALUE interrupterThread = Qnil;
VALUE mainThread = Qnil;

constexpr DWORD kGrace = 500;  // milliseconds for `ensure` blocks

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

void OnEvent(VALUE, rb_trace_arg_t* event) {
  if (!Interpreter::IsMainThread() || Interpreter::InterruptDue() == Interpreter::Urgency::kNone)
    return;
  if (rb_tracearg_event_flag(event) == RUBY_EVENT_RAISE) {
    const bool isStop = rb_obj_class(rb_tracearg_raised_exception(event)) == StopClass();
    if (!isStop || !IsOnGuardedFiber()) return;
  } else {
    VALUE ignored;
    Protect(CheckInterrupts, Qnil, ignored);  // the exception is not needed any more
  }
  Interrupter::RemoveHook();
  LeaveTask();
}

// A hook with this flag has parameters of its own.
rb_event_hook_func_t Hook() {
  return reinterpret_cast<rb_event_hook_func_t>(reinterpret_cast<void*>(OnEvent));
}

VALUE RaiseOnMainThread(VALUE) {
  return rb_funcall(mainThread, rb_intern("raise"), 1, StopClass());
}

void SetHook(rb_event_flag_t events) {
  Interrupter::RemoveHook();
  rb_add_event_hook2(Hook(), events, Qnil, RUBY_EVENT_HOOK_FLAG_RAW_ARG);
}

VALUE Deliver(VALUE) {
  SetHook(RUBY_EVENT_LINE | RUBY_EVENT_CALL | RUBY_EVENT_B_CALL | RUBY_EVENT_RAISE);
  return RaiseOnMainThread(Qnil);
}

VALUE Interrupt(void*) {
  for (;;) {
    Wait(INFINITE);
    while (Interpreter::InterruptDue() != Interpreter::Urgency::kNone) {
      if (Interpreter::InterruptDue() == Interpreter::Urgency::kAfterGrace) Wait(kGrace);
      if (Interpreter::InterruptDue() == Interpreter::Urgency::kNone) break;
      VALUE ignored;
      Protect(Deliver, Qnil, ignored);
      Wait(kGrace);
    }
  }
}

}  // namespace

void Interrupter::EnsureAlive() {
  if (!wakeEvent) {
    wakeEvent = CreateEventW(nullptr, FALSE, FALSE, nullptr);
    if (!wakeEvent) return;  // tried again by the next macro
    mainThread = rb_thread_current();
    rb_gc_register_address(&mainThread);
    rb_gc_register_address(&interrupterThread);
  }
  if (interrupterThread != Qnil && RTEST(rb_funcall(interrupterThread, rb_intern("alive?"), 0)))
    return;
  interrupterThread = rb_thread_create(Interrupt, nullptr);
  rb_funcall(rb_const_get(rb_cObject, rb_intern("ActiveScript")), rb_intern("interrupter="), 1,
             interrupterThread);
}

void Interrupter::RemoveHook() { rb_remove_event_hook(Hook()); }

void Interrupter::LeaveAtResumer() { SetHook(RUBY_EVENT_RAISE); }

void Interrupter::StopMainThread() {
  VALUE ignored;
  Protect(RaiseOnMainThread, Qnil, ignored);
}

void Interrupter::Settle() {
  RemoveHook();
  VALUE ignored;
  constexpr int kMostPending = 1000;  // a thread of the macro's may have raised some as well
  for (int i = 0; i < kMostPending; ++i)
    if (Protect(CheckInterrupts, Qnil, ignored) == Outcome::kDone) break;
}

void Interrupter::Wake() {
  if (wakeEvent) SetEvent(wakeEvent);
}
