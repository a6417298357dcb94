// SPDX-License-Identifier: MIT
#include "Interpreter.h"
// Last: it renames what the header above uses.
#include "RubyInternals.h"
#include "RubyCall.h"

namespace {

struct Guarded {
  VALUE (*body)(VALUE);
  VALUE argument;
};

struct SendArguments {
  VALUE receiver;
  const char* method;
  int count;
  const VALUE* arguments;
};

// Thrown to leave a task; also what its catch answers then.
VALUE LeaveTag() {
  static VALUE tag = Qnil;
  if (tag == Qnil) {
    tag = rb_str_new_cstr("the macro has been stopped");
    rb_gc_register_mark_object(tag);
  }
  return tag;
}

// The fiber that the innermost Protect of the main thread is in.
VALUE guardedFiber = Qnil;

VALUE CallBody(VALUE, VALUE data, int, const VALUE*, VALUE) {
  const Guarded& guarded = *reinterpret_cast<Guarded*>(data);
  return guarded.body(guarded.argument);
}

VALUE Catch(VALUE data) {
  if (Interpreter::IsMainThread()) guardedFiber = rb_fiber_current();
  return rb_catch_obj(LeaveTag(), CallBody, data);
}

VALUE CallUntraced(VALUE data) {
  const Guarded& guarded = *reinterpret_cast<Guarded*>(data);
  return rb_suppress_tracing(guarded.body, guarded.argument);
}

VALUE CallMethod(VALUE data) {
  const SendArguments& call = *reinterpret_cast<SendArguments*>(data);
  return rb_funcallv(call.receiver, rb_intern(call.method), call.count, call.arguments);
}

}  // namespace

Outcome Protect(VALUE (*body)(VALUE), VALUE argument, VALUE& result) {
  // Ruby's jumps do not restore the chain of exception handlers.
  const unsigned long handlers = __readfsdword(0);
  const VALUE outerFiber = guardedFiber;
  Guarded guarded = {body, argument};
  int state = 0;
  result = rb_protect(Catch, reinterpret_cast<VALUE>(&guarded), &state);
  __writefsdword(0, handlers);
  if (Interpreter::IsMainThread()) guardedFiber = outerFiber;
  if (state == 0) return result == LeaveTag() ? Outcome::kLeft : Outcome::kDone;
  result = rb_errinfo();
  rb_set_errinfo(Qnil);
  // A throw to a catch of an outer macro leaves an object that is not for Ruby code.
  if (!RB_TYPE_P(result, T_OBJECT))
    result = rb_exc_new_cstr(rb_eLocalJumpError, "jump out of the macro");
  return RTEST(rb_obj_is_kind_of(result, StopClass())) ? Outcome::kLeft : Outcome::kRaised;
}

Outcome ProtectUntraced(VALUE (*body)(VALUE), VALUE argument, VALUE& result) {
  Guarded guarded = {body, argument};
  return Protect(CallUntraced, reinterpret_cast<VALUE>(&guarded), result);
}

Outcome Send(VALUE receiver, const char* method, int count, const VALUE* arguments, VALUE& result) {
  SendArguments call = {receiver, method, count, arguments};
  return Protect(CallMethod, reinterpret_cast<VALUE>(&call), result);
}

// A fiber of the macro's own has no such tag: there the exception goes to the one that resumed it.
void LeaveTask() {
  Interpreter::SetLeaving();
  if (rb_fiber_current() == guardedFiber) rb_throw_obj(LeaveTag(), LeaveTag());
  rb_raise(StopClass(), "the macro has been stopped");
}

VALUE ActiveScriptModule() {
  static const VALUE module = rb_path2class("ActiveScript");
  return module;
}

VALUE ActiveScriptConst(const char* name) {
  return rb_const_get(ActiveScriptModule(), rb_intern(name));
}

VALUE StopClass() {
  static const VALUE stop = ActiveScriptConst("Stop");
  return stop;
}
