// SPDX-License-Identifier: MIT
#include "ProcessGuards.h"

#include <signal.h>
#include <windows.h>

#include "Interpreter.h"
#include "RubyRuntime.h"
// Last: they rename what the headers above use.
#include "RubyCall.h"
#include "RubyInternals.h"

namespace {

VALUE CurrentContext() {
  return rb_funcall(ActiveScriptConst("Context"), rb_intern("current"), 0);
}

VALUE AtExit(VALUE) {
  if (!rb_block_given_p()) rb_raise(rb_eArgError, "called without block");
  return rb_funcall(CurrentContext(), rb_intern("at_exit"), 1, rb_block_proc());
}

VALUE Exec(int, const VALUE*, VALUE) {
  rb_raise(rb_eNotImpError, "exec would replace the host's process; use system or spawn");
}

VALUE Reopen(int, const VALUE*, VALUE) {
  rb_raise(rb_eNotImpError,
           "the stream belongs to the host; assign to $stdin, $stdout or $stderr instead");
}

VALUE ExitAtOnce(int count, const VALUE* arguments, VALUE) {
  rb_check_arity(count, 0, 1);
  const VALUE status = count == 0 ? Qfalse : arguments[0];
  rb_exit(status == Qtrue ? 0 : status == Qfalse ? 1 : NUM2INT(status));
}

// The host gets the text with the error, so it is not printed.
VALUE Abort(int count, const VALUE* arguments, VALUE) {
  const VALUE output = rb_gv_get("$stderr");
  if (count != 1 || !RTEST(rb_obj_is_kind_of(output, ActiveScriptConst("HostOutput"))))
    return rb_f_abort(count, arguments);
  VALUE text = arguments[0];
  VALUE details[] = {INT2FIX(1), StringValue(text)};
  rb_exc_raise(rb_class_new_instance(2, details, rb_eSystemExit));
}

// A macro that is started inside a fiber of another one must not yield for it.
VALUE FiberYield(int count, const VALUE* arguments, VALUE) {
  if (Interpreter::IsMainThread()) {
    const VALUE context = CurrentContext();
    if (!NIL_P(context) && rb_funcall(context, rb_intern("fiber"), 0) == rb_fiber_current())
      rb_raise(rb_path2class("FiberError"), "can't yield from root fiber");
  }
  return rb_fiber_yield_kw(count, arguments, rb_keyword_given_p());
}

// --- Signals -------------------------------------------------------------------------------------

// Of a signal's name or number; 0 for "EXIT" and what CRuby does not know.
int SignalNumber(VALUE signal) {
  if (FIXNUM_P(signal)) return FIX2INT(signal);
  const VALUE name = rb_funcall(rb_String(signal), rb_intern("delete_prefix"), 1,
                                rb_str_new_cstr("SIG"));
  const VALUE number =
      rb_hash_aref(rb_funcall(rb_path2class("Signal"), rb_intern("list"), 0), name);
  return NIL_P(number) ? 0 : FIX2INT(number);
}

bool NamesThisProcess(int count, const VALUE* arguments) {
  for (int i = 1; i < count; ++i) {
    const long id = NUM2LONG(arguments[i]);
    if (id == 0 || static_cast<DWORD>(id) == GetCurrentProcessId()) return true;
  }
  return false;
}

// Whether the macro has called `trap` for the signal: CRuby's handler is then in place.
bool IsTrapped(int number) {
  const __p_sig_fn_t handler = signal(number, SIG_IGN);
  if (handler == SIG_ERR) return false;
  signal(number, handler);
  if (handler == SIG_IGN) return true;
  return handler != SIG_DFL && IsRubyCode(reinterpret_cast<const void*>(handler));
}

// The signals that CRuby handles reach the main thread as an exception, or the macro's handler.
VALUE Kill(int count, const VALUE* arguments, VALUE) {
  const int number = count < 2 ? 0 : SignalNumber(arguments[0]);
  if (number == 0 || !NamesThisProcess(count, arguments)) return rb_f_kill(count, arguments);
  if (IsTrapped(number)) {
    if (Interpreter::IsMainThread()) return rb_f_kill(count, arguments);
    raise(number);
    return INT2FIX(count - 1);
  }
  const VALUE exception = number == SIGINT ? rb_exc_new_cstr(rb_eInterrupt, "")
                                           : rb_class_new_instance(1, arguments, rb_eSignal);
  if (Interpreter::IsMainThread()) rb_exc_raise(exception);
  void* const main = RTYPEDDATA_DATA(rb_thread_main());
  rb_threadptr_pending_interrupt_enque(main, exception);
  rb_threadptr_interrupt(main);
  return INT2FIX(count - 1);
}

}  // namespace

void DefineProcessGuards() {
  rb_define_global_function("at_exit", AtExit, 0);
  rb_ext_ractor_safe(true);
  rb_define_global_function("exec", Exec, -1);
  rb_define_global_function("exit!", ExitAtOnce, -1);
  rb_define_global_function("abort", Abort, -1);
  rb_define_singleton_method(rb_mProcess, "exec", Exec, -1);
  rb_define_singleton_method(rb_mProcess, "exit!", ExitAtOnce, -1);
  rb_define_singleton_method(rb_mProcess, "abort", Abort, -1);
  rb_define_singleton_method(rb_mProcess, "kill", Kill, -1);
  rb_define_singleton_method(rb_path2class("Fiber"), "yield", FiberYield, -1);
  rb_ext_ractor_safe(false);
  const VALUE streams[] = {rb_stdin, rb_stdout, rb_stderr};
  for (const VALUE stream : streams)
    rb_define_singleton_method(stream, "reopen", Reopen, -1);
}
