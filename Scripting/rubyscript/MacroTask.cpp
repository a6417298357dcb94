// SPDX-License-Identifier: MIT
#include "MacroTask.h"

#include <new>

#include "Interrupter.h"
#include "RubyRuntime.h"
// Last: they rename what the headers above use.
#include "ComObject.h"
#include "RubyCall.h"
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
  Interrupter::EnsureAlive();
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

VALUE MacroTask::CallFunction() {
  const VALUE list = rb_ary_new();
  for (UINT i = arguments->cArgs; i-- > 0;)
    rb_ary_push(list, FromVariant(arguments->rgvarg[i], engineState.form));
  return rb_funcall(engineState.context, rb_intern("call"), 2, StringOf(text, TextForm::kUtf16),
                    list);
}

VALUE MacroTask::WorkBody(VALUE data) {
  MacroTask& task = From(data);
  switch (task.kind) {
    case Kind::kCompile:
      return task.Compile();
    case Kind::kRun: {
      const VALUE value = rb_funcall(task.engineState.context, rb_intern("run"), 0);
      return task.wantsValue ? ToVariantValue(value, task.engineState.form) : Qnil;
    }
    case Kind::kCall:
      return ToVariantValue(task.CallFunction(), task.engineState.form);
    case Kind::kDefines:
      return rb_funcall(task.engineState.context, rb_intern("defines?"), 1,
                        StringOf(task.text, TextForm::kUtf16));
    case Kind::kDiscard:
      break;
  }
  return Qnil;
}

VALUE MacroTask::LeaveBody(VALUE data) {
  return rb_funcall(From(data).engineState.context, rb_intern("leave"), 0);
}

VALUE MacroTask::DiscardBody(VALUE data) {
  EngineState& engineState = From(data).engineState;
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
  } else if (kind == Kind::kCompile) {
    result = S_OK;
  } else {
    result = FillVariant(passable, engineState.form, value) ? S_OK : E_OUTOFMEMORY;
  }
}

namespace {

struct Description {
  VALUE context;
  VALUE exception;
  BSTR hostText;
  TextForm form;
  BSTR text;
  ULONG line;
  LONG column;
  BSTR lineText;
  DWORD cookie;
};

BSTR TextOf(VALUE string, TextForm form) {
  return TextToHost(RSTRING_PTR(string), static_cast<UINT>(RSTRING_LEN(string)), form);
}

}  // namespace

VALUE MacroTask::DescribeBody(VALUE data) {
  Description& description = *reinterpret_cast<Description*>(data);
  const VALUE hostText =
      description.hostText ? StringOf(description.hostText, TextForm::kUtf16) : Qnil;
  const VALUE parts =
      rb_funcall(description.context, rb_intern("describe"), 2, description.exception, hostText);
  description.line = NUM2ULONG(rb_ary_entry(parts, 1));
  description.column = NUM2LONG(rb_ary_entry(parts, 2));
  description.cookie = NUM2ULONG(rb_ary_entry(parts, 4));
  description.text = TextOf(rb_ary_entry(parts, 0), description.form);
  description.lineText = TextOf(rb_ary_entry(parts, 3), description.form);
  return Qnil;
}

// Asks the exception, which may run the macro's own code: Ruby's exceptions have methods.
void MacroTask::SetError(VALUE exception, BSTR hostText) {
  Description description = {
      engineState.context, exception, hostText, engineState.form, nullptr, 0, 0, nullptr, 0};
  VALUE ignored;
  if (Protect(DescribeBody, reinterpret_cast<VALUE>(&description), ignored) == Outcome::kLeft) {
    result = E_ABORT;
    return;
  }
  if (!description.text) description.text = SysAllocString(L"An error that cannot be described.");
  error =
      new (std::nothrow) ScriptError(E_FAIL, description.text, description.line, description.column,
                                     description.lineText, description.cookie);
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
    const Outcome outcome = Protect(WorkBody, reinterpret_cast<VALUE>(this), outcomeValue);
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

void MacroTask::Run() {
  VALUE ignored;
  const VALUE self = reinterpret_cast<VALUE>(this);
  if (kind == Kind::kDiscard) {
    if (engineState.context) Protect(DiscardBody, self, ignored);
    result = S_OK;
    return;
  }
  if (kind != Kind::kCompile) ApplyRubyEnvironment();
  const Outcome prepared = Protect(PrepareBody, self, ignored);
  if (prepared == Outcome::kRaised) SetError(ignored);
  if (prepared != Outcome::kDone) return;
  Work();
  Protect(LeaveBody, self, ignored);
  // Nobody may ever close this engine.
  if (Interpreter::IsAbandoned()) Protect(DiscardBody, self, ignored);
}
