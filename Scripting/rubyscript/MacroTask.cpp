// SPDX-License-Identifier: MIT
#include "MacroTask.h"

#include <new>

#include "Interrupter.h"
#include "RubyRuntime.h"
// Last: they rename what the headers above use.
#include "ClassSnapshot.h"
#include "ComObject.h"
#include "OleEmbedder.h"
#include "RubyCall.h"
#include "RubyInternals.h"
#include "VariantConversion.h"

static_assert(sizeof(VALUE) == sizeof(unsigned long) && Qfalse == 0, "EngineState holds a value");

MacroTask::~MacroTask() {
  SysFreeString(text);
  if (error) error->Release();
  VariantClear(&value);
}

static MacroTask& From(VALUE data) { return *reinterpret_cast<MacroTask*>(data); }

static VALUE StringOf(BSTR text, TextForm form) {
  return StringFromHost(text, SysStringLen(text), form, TextOrigin::kSource);
}

// The context with all items that are new.
VALUE MacroTask::PrepareBody(VALUE data) {
  MacroTask& task = From(data);
  Interrupter::EnsureStarted();
  if (!task.engineState.context) {
    const VALUE isByteHost = task.engineState.form == TextForm::kBytes ? Qtrue : Qfalse;
    const volatile VALUE context =  // collecting finds it on the stack
        rb_funcall(ActiveScriptConst("Context"), rb_intern("new"), 1, isByteHost);
    task.engineState.context = context;
    rb_gc_register_address(&task.engineState.context);
  }
  for (NamedItem* item = task.items; item; item = item->next) {
    if (!item->dispatch) continue;
    const VALUE name = StringOf(item->name, TextForm::kUtf16);
    const VALUE object = NewComObject(item->dispatch, task.engineState.form, name);
    item->dispatch = nullptr;
    rb_funcall(task.engineState.context, rb_intern("add_item"), 2, name, object);
  }
  return rb_funcall(task.engineState.context, rb_intern("enter"), 0);
}

VALUE MacroTask::Compile() {
  // A unit that is no byte shows that this text is not an 8-bit host's.
  const TextForm form = HoldsBytes(text, SysStringLen(text)) ? engineState.form : TextForm::kUtf16;
  return rb_funcall(engineState.context, rb_intern("compile"), 4, StringOf(text, form),
                    ULONG2NUM(firstLine + 1), ULONG2NUM(cookie), persistent ? Qtrue : Qfalse);
}

VALUE MacroTask::WorkBody(VALUE data) {
  MacroTask& task = From(data);
  if (task.kind == Kind::kCompile) return task.Compile();
  return rb_funcall(task.engineState.context, rb_intern("defines?"), 1,
                    StringOf(task.text, TextForm::kUtf16));
}

// --- The macro's own code ------------------------------------------------------------------------

// Called without a Ruby method in between, so that its backtraces hold no frame of the engine.
struct MacroTask::Code {
  MacroTask& task;
  VALUE list;   // what is compiled, or the function's arguments
  VALUE value;  // of the code
  VALUE block;  // of at_exit
  VALUE error;  // of the code or the block before; nil without one
};

static MacroTask::Code& CodeFrom(VALUE data) { return *reinterpret_cast<MacroTask::Code*>(data); }

VALUE MacroTask::StartBody(VALUE data) {
  Code& code = CodeFrom(data);
  MacroTask& task = code.task;
  const VALUE context = task.engineState.context;
  rb_funcall(context, rb_intern("start_work"), 0);
  if (task.kind == Kind::kRun) {
    code.list = rb_funcall(context, rb_intern("take_codes"), 0);
  } else if (task.kind == Kind::kCall) {
    code.list = rb_ary_new();
    for (UINT i = task.arguments->cArgs; i-- > 0;)
      rb_ary_push(code.list, FromVariant(task.arguments->rgvarg[i], task.engineState.form));
  }
  return Qnil;
}

VALUE MacroTask::CodeBody(VALUE data) {
  Code& code = CodeFrom(data);
  MacroTask& task = code.task;
  if (task.kind == Kind::kCallBack) return task.callBack(task.callBackData), Qnil;
  if (task.kind == Kind::kCall) {
    const VALUE name = StringOf(task.text, TextForm::kUtf16);
    const VALUE main = rb_funcall(task.engineState.context, rb_intern("main"), 0);
    return rb_apply(main, rb_intern_str(name), code.list);
  }
  VALUE value = Qnil;
  for (long i = 0; i < RARRAY_LEN(code.list); ++i)
    value = rb_iseq_eval(rb_iseqw_to_iseq(rb_ary_entry(code.list, i)));
  return value;
}

VALUE MacroTask::NextBlockBody(VALUE data) {
  Code& code = CodeFrom(data);
  return code.block =
             rb_funcall(code.task.engineState.context, rb_intern("next_exit_block"), 1, code.error);
}

VALUE MacroTask::ExitBlockBody(VALUE data) {
  rb_set_errinfo(CodeFrom(data).error);  // as `$!`
  return rb_proc_call(CodeFrom(data).block, rb_ary_new());
}

// The error to report, or nil; the value is converted in the latter case.
VALUE MacroTask::FinishBody(VALUE data) {
  Code& code = CodeFrom(data);
  const MacroTask& task = code.task;
  rb_set_errinfo(Qnil);
  const VALUE error = rb_funcall(task.engineState.context, rb_intern("finish_work"), 0);
  const bool wanted = NIL_P(error) && (task.kind == Kind::kCall || task.wantsValue);
  code.value = wanted ? ToVariantValue(code.value, task.engineState.form) : Qnil;
  return error;
}

VALUE MacroTask::EndBody(VALUE data) {
  return rb_funcall(From(data).engineState.context, rb_intern("end_work"), 0);
}

// The code, then the blocks of at_exit, each of which sees the last error.
Outcome MacroTask::RunCode(Code& code) {
  const VALUE self = reinterpret_cast<VALUE>(&code);
  Outcome outcome = Protect(StartBody, self, code.error);
  if (outcome != Outcome::kDone) return outcome;
  VALUE (*body)(VALUE) = CodeBody;
  VALUE answer;
  do {
    outcome = Protect(body, self, answer);
    if (outcome == Outcome::kLeft) return code.error = answer, outcome;
    if (outcome == Outcome::kDone && body == CodeBody) code.value = answer;
    if (outcome == Outcome::kRaised) code.error = answer;
    outcome = Protect(NextBlockBody, self, answer);
    if (outcome != Outcome::kDone) return code.error = answer, outcome;
    body = ExitBlockBody;
  } while (!NIL_P(code.block));
  outcome = Protect(FinishBody, self, code.error);
  return outcome == Outcome::kDone && !NIL_P(code.error) ? Outcome::kRaised : outcome;
}

Outcome MacroTask::RunMacro(VALUE& outcomeValue) {
  Code code = {*this, Qnil, Qnil, Qnil, Qnil};
  VALUE ignored;
  const Outcome outcome = RunCode(code);
  Protect(EndBody, reinterpret_cast<VALUE>(this), ignored);
  outcomeValue = outcome == Outcome::kDone ? code.value : code.error;
  return outcome;
}

VALUE MacroTask::EndThreadsBody(VALUE data) {
  return rb_funcall(From(data).engineState.context, rb_intern("end_threads"), 0);
}

VALUE MacroTask::LeaveBody(VALUE data) {
  return rb_funcall(From(data).engineState.context, rb_intern("leave"), 0);
}

VALUE MacroTask::FinalizeBody(VALUE data) {
  return rb_funcall(From(data).engineState.context, rb_intern("run_finalizers"), 0);
}

VALUE MacroTask::DiscardBody(VALUE data) {
  EngineState& engineState = From(data).engineState;
  CloseOleObjects();
  rb_funcall(engineState.context, rb_intern("close"), 0);
  engineState.context =
      From(data).persistent ? rb_funcall(engineState.context, rb_intern("successor"), 0) : Qnil;
  if (NIL_P(engineState.context)) {
    rb_gc_unregister_address(&engineState.context);
    engineState.context = 0;
  }
  return Qnil;
}

void MacroTask::SetValue(VALUE passable) {
  if (kind == Kind::kDefines) {
    result = RTEST(passable) ? S_OK : S_FALSE;
  } else if (kind == Kind::kCompile || kind == Kind::kCallBack) {
    result = S_OK;
  } else {
    result = FillVariant(passable, engineState.form, value) ? S_OK : E_OUTOFMEMORY;
  }
}

namespace {

struct Description {
  VALUE context;
  VALUE exception;
  VALUE message;
  BSTR hostText;
  TextForm form;
  ScriptError::Details details;
};

BSTR TextOf(VALUE string, TextForm form) {
  return TextToHost(RSTRING_PTR(string), static_cast<UINT>(RSTRING_LEN(string)), form);
}

// What the host's own object has said of the call that failed. A macro may have made such an error
// itself, with anything inside.
void DescribeFailedCall(Description& description) {
  const VALUE exception = description.exception;
  if (!RTEST(rb_obj_is_kind_of(exception, ActiveScriptConst("ComError")))) return;
  ScriptError::Details& details = description.details;
  const VALUE code = rb_ivar_get(exception, rb_intern("@hresult"));
  const VALUE wcode = rb_ivar_get(exception, rb_intern("@wcode"));
  const VALUE helpFile = rb_ivar_get(exception, rb_intern("@help_file"));
  const VALUE helpContext = rb_ivar_get(exception, rb_intern("@help_context"));
  if (RB_INTEGER_TYPE_P(code) && FAILED(static_cast<HRESULT>(NUM2ULONG(code))))
    details.code = static_cast<HRESULT>(NUM2ULONG(code));
  if (FIXNUM_P(wcode)) details.wCode = static_cast<WORD>(FIX2LONG(wcode));
  if (RB_INTEGER_TYPE_P(helpContext)) details.helpContext = NUM2ULONG(helpContext);
  if (RB_TYPE_P(helpFile, T_STRING)) details.helpFile = TextOf(helpFile, description.form);
}

VALUE MessageBody(VALUE exception) {
  return rb_obj_as_string(rb_funcall(exception, rb_intern("message"), 0));
}

}  // namespace

VALUE MacroTask::DescribeBody(VALUE data) {
  Description& description = *reinterpret_cast<Description*>(data);
  const VALUE hostText =
      description.hostText ? StringOf(description.hostText, TextForm::kUtf16) : Qnil;
  const VALUE parts = rb_funcall(description.context, rb_intern("describe"), 3,
                                 description.exception, hostText, description.message);
  ScriptError::Details& details = description.details;
  details.line = NUM2ULONG(rb_ary_entry(parts, 1));
  details.column = NUM2LONG(rb_ary_entry(parts, 2));
  details.context = NUM2ULONG(rb_ary_entry(parts, 4));
  details.description = TextOf(rb_ary_entry(parts, 0), description.form);
  details.lineText = TextOf(rb_ary_entry(parts, 3), description.form);
  DescribeFailedCall(description);
  return Qnil;
}

// Asks the exception for its message, which may run the macro's own code. The rest is the engine's.
void MacroTask::SetError(VALUE exception, BSTR hostText) {
  VALUE message;
  Outcome outcome = Protect(MessageBody, exception, message);
  if (outcome == Outcome::kRaised) message = rb_utf8_str_new_cstr("");
  Description description = {engineState.context, exception, message, hostText,
                             engineState.form,    {}};
  ScriptError::Details& details = description.details;
  if (outcome != Outcome::kLeft) {
    VALUE ignored;
    const VALUE context = ClassSnapshot::Suspend();
    outcome = ProtectUntraced(DescribeBody, reinterpret_cast<VALUE>(&description), ignored);
    ClassSnapshot::Resume(context);
  }
  if (outcome == Outcome::kLeft) {
    SysFreeString(details.helpFile);
    result = E_ABORT;
    return;
  }
  if (!details.description)
    details.description = SysAllocString(L"An error that cannot be described.");
  error = new (std::nothrow) ScriptError(details);
  result = error ? DISP_E_EXCEPTION : E_OUTOFMEMORY;
}

// The site is told of it like of an error if the host has a text for it and the macro was left by an
// exception, which knows where.
void MacroTask::TellInterruption(VALUE exception) {
  const BSTR hostText = static_cast<BSTR>(
      InterlockedExchangePointer(reinterpret_cast<void**>(&engineState.interruption), nullptr));
  if (hostText && RTEST(rb_obj_is_kind_of(exception, StopClass()))) SetError(exception, hostText);
  SysFreeString(hostText);
}

void MacroTask::Work() {
  VALUE outcomeValue = Qnil;
  result = E_ABORT;
  Interpreter::SetInterruptible(true);
  if (!Interpreter::MustEnd()) {  // else it was interrupted before it began
    const bool isMacro = kind == Kind::kRun || kind == Kind::kCall || kind == Kind::kCallBack;
    const Outcome outcome = isMacro
                                ? RunMacro(outcomeValue)
                                : Protect(WorkBody, reinterpret_cast<VALUE>(this), outcomeValue);
    if (outcome == Outcome::kDone) SetValue(outcomeValue);
    if (outcome == Outcome::kRaised) {
      Interrupter::Settle();  // threads of the macro's may have raised more
      if (!Interpreter::MustEnd()) SetError(outcomeValue);
    }
  }
  Interpreter::SetInterruptible(false);
  Interrupter::Settle();
  if (Interpreter::MustEnd()) result = E_ABORT;  // also of a macro that has come to its end
  TellInterruption(outcomeValue);
}

// Finalizers are the macro's code.
void MacroTask::Discard() {
  VALUE ignored;
  const VALUE self = reinterpret_cast<VALUE>(this);
  ClassSnapshot::Resume(engineState.context);
  Interpreter::SetInterruptible(true);
  Protect(FinalizeBody, self, ignored);
  Interpreter::SetInterruptible(false);
  Interrupter::Settle();
  ClassSnapshot::Suspend();
  ProtectUntraced(DiscardBody, self, ignored);
}

void MacroTask::RunInContext() {
  VALUE ignored;
  const VALUE self = reinterpret_cast<VALUE>(this);
  if (kind == Kind::kDiscard) {
    if (engineState.context) Discard();
    result = S_OK;
    return;
  }
  if (kind != Kind::kCompile) ApplyRubyEnvironment();
  const Outcome prepared = ProtectUntraced(PrepareBody, self, ignored);
  if (prepared == Outcome::kRaised) SetError(ignored);
  if (prepared != Outcome::kDone) return;
  ClassSnapshot::Resume(engineState.context);
  Work();
  ProtectUntraced(EndThreadsBody, self, ignored);
  ClassSnapshot::Suspend();
  if (ProtectUntraced(LeaveBody, self, ignored) != Outcome::kDone || RTEST(ignored))
    ClassSnapshot::DropChanges();
  // Nobody may ever close this engine.
  if (Interpreter::IsAbandoned()) Discard();
}

void MacroTask::Run() {
  const VALUE waiting = ClassSnapshot::Suspend();  // in a call of the host
  RunInContext();
  ClassSnapshot::Resume(waiting);
}
