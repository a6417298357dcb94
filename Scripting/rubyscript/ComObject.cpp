// SPDX-License-Identifier: MIT
#include <stdlib.h>

#include "Interpreter.h"
#include "VariantConversion.h"
// Last: they rename what the headers above use.
#include "ComObject.h"
#include "OleEmbedder.h"
#include "RubyCall.h"

namespace {

// Of one Ruby object, in the list of all that are alive; then in that of the collected ones.
struct Wrapped {
  IDispatch* dispatch;
  const void* owner;
  TextForm form;
  VALUE name;  // String or nil
  VALUE ids;   // Hash: Symbol => DISPID; constant for an object by COM's rules
  Wrapped* previous;
  Wrapped* next;
};

Wrapped* live = nullptr;
Wrapped* collected = nullptr;

void Mark(void* data) {
  const Wrapped& wrapped = *static_cast<Wrapped*>(data);
  rb_gc_mark(wrapped.name);
  rb_gc_mark(wrapped.ids);
}

// Runs in the collector: neither Ruby nor the object can be called.
void Free(void* data) {
  Wrapped* const wrapped = static_cast<Wrapped*>(data);
  (wrapped->previous ? wrapped->previous->next : live) = wrapped->next;
  if (wrapped->next) wrapped->next->previous = wrapped->previous;
  wrapped->next = collected;
  collected = wrapped;
}

const rb_data_type_t kType = {
    "ComObject", {Mark, Free, nullptr, nullptr, {}}, nullptr, nullptr, RUBY_TYPED_FREE_IMMEDIATELY};

VALUE comObjectClass = Qnil;

Wrapped& Unwrap(VALUE object) { return *static_cast<Wrapped*>(rb_check_typeddata(object, &kType)); }

// Not rb_memerror: its mark on the thread stays where no Ruby code is between here and what catches
// the error, and with the mark set the next one ends the process.
[[noreturn]] void RaiseNoMemory() { rb_raise(rb_eNoMemError, "failed to allocate memory"); }

// --- Calls ---------------------------------------------------------------------------------------

struct NameLookup final : HostCall {
  IDispatch* dispatch = nullptr;
  BSTR name = nullptr;
  DISPID id = DISPID_UNKNOWN;
  HRESULT outcome = E_FAIL;

  void Run() override {
    outcome = dispatch->GetIDsOfNames(IID_NULL, &name, 1, LOCALE_USER_DEFAULT, &id);
  }
};

struct Invocation final : HostCall {
  IDispatch* dispatch = nullptr;
  DISPID id = 0;
  WORD flags = 0;
  DISPPARAMS parameters = {};
  VARIANT result = {};
  EXCEPINFO exception = {};
  HRESULT outcome = E_FAIL;

  void Run() override {
    ReleaseCollectedObjects();
    const bool wantsResult = (flags & DISPATCH_PROPERTYGET) != 0;
    UINT badArgument = 0;
    outcome = dispatch->Invoke(id, IID_NULL, LOCALE_USER_DEFAULT, flags, &parameters,
                               wantsResult ? &result : nullptr, &exception, &badArgument);
    if (outcome == DISP_E_EXCEPTION && exception.pfnDeferredFillIn)
      exception.pfnDeferredFillIn(&exception);
    if (SUCCEEDED(outcome) && result.vt == VT_UNKNOWN && result.punkVal) TakeDispatch();
    if (!Interpreter::MustEnd()) return;
    VariantClear(&result);  // no caller takes it now
    FreeException();
  }

  void FreeException() {
    SysFreeString(exception.bstrDescription);
    SysFreeString(exception.bstrSource);
    SysFreeString(exception.bstrHelpFile);
    exception = {};
  }

  // An object that has no IDispatch stays what it is.
  void TakeDispatch() {
    void* object = nullptr;
    if (FAILED(result.punkVal->QueryInterface(IID_IDispatch, &object))) return;
    result.punkVal->Release();
    result.vt = VT_DISPATCH;
    result.pdispVal = static_cast<IDispatch*>(object);
  }
};

struct ClearResult final : HostCall {
  VARIANT* variant = nullptr;
  void Run() override { VariantClear(variant); }
};

VALUE BstrToString(BSTR text, TextForm form) {
  return text ? StringFromHost(text, SysStringLen(text), form, TextOrigin::kResult) : Qnil;
}

[[noreturn]] void RaiseUnknown(const Wrapped& wrapped, VALUE name, HRESULT outcome) {
  rb_exc_raise(rb_funcall(ActiveScriptConst("ComError"), rb_intern("unknown"), 3, wrapped.name,
                          name, ULONG2NUM(static_cast<ULONG>(outcome))));
}

[[noreturn]] void RaiseInvocationFailure(const Wrapped& wrapped, VALUE name, Invocation& call) {
  EXCEPINFO& exception = call.exception;
  const VALUE description = BstrToString(exception.bstrDescription, wrapped.form);
  const VALUE source = BstrToString(exception.bstrSource, wrapped.form);
  const VALUE helpFile = BstrToString(exception.bstrHelpFile, wrapped.form);
  const bool coded = call.outcome == DISP_E_EXCEPTION && FAILED(exception.scode);
  const VALUE code = ULONG2NUM(static_cast<ULONG>(coded ? exception.scode : call.outcome));
  const VALUE wcode = INT2FIX(exception.wCode);
  const VALUE helpContext = ULONG2NUM(exception.dwHelpContext);
  call.FreeException();
  rb_exc_raise(rb_funcall(ActiveScriptConst("ComError"), rb_intern("for"), 8, wrapped.name, name,
                          code, description, source, wcode, helpFile, helpContext));
}

// A call on a thread of the macro's own, or on an object whose engine is closed.
void CheckCallable(const Wrapped& wrapped) {
  if (!Interpreter::IsMainThread())
    rb_raise(rb_eThreadError, "only the macro's main thread can call the host");
  if (!wrapped.dispatch) rb_raise(rb_eRuntimeError, "the COM object is gone: its engine is closed");
}

// --- Names ---------------------------------------------------------------------------------------

// The name without a setter's "="; 0 for operators, queries and the like, which no object has.
long NameLength(VALUE symbolName, bool& isSetter) {
  const char* const text = RSTRING_PTR(symbolName);
  const long length = RSTRING_LEN(symbolName);
  if (length == 0) return 0;
  const unsigned char first = static_cast<unsigned char>(text[0]);
  const unsigned char last = static_cast<unsigned char>(text[length - 1]);
  isSetter = last == '=';
  const bool begins = ISALPHA(first) || first == '_' || first >= 0x80;
  return !begins || last == '?' || last == '!' ? 0 : length - isSetter;
}

HRESULT LookUp(Wrapped& wrapped, const char* name, long length, DISPID& id) {
  NameLookup lookup;
  lookup.dispatch = wrapped.dispatch;
  lookup.name = TextToHost(name, static_cast<UINT>(length), wrapped.form);
  if (!lookup.name) RaiseNoMemory();
  const bool goesOn = Interpreter::CallHost(lookup);
  SysFreeString(lookup.name);
  if (!goesOn) LeaveTask();
  id = lookup.id;
  return lookup.outcome;
}

// --- Invoking ------------------------------------------------------------------------------------

constexpr int kFewArguments = 8;

struct ResultConversion {
  Invocation* call;
  TextForm form;
};

VALUE ConvertResult(VALUE data) {
  const ResultConversion& conversion = *reinterpret_cast<ResultConversion*>(data);
  return FromVariant(conversion.call->result, conversion.form);
}

VALUE ClearOnHost(VALUE data) {
  ClearResult clear;
  clear.variant = &reinterpret_cast<ResultConversion*>(data)->call->result;
  Interpreter::CallHost(clear);
  return Qnil;
}

VALUE TakeResult(Invocation& call, TextForm form) {
  VARIANT& result = call.result;
  if (result.vt == VT_DISPATCH)  // with its reference
    return result.pdispVal ? NewComObject(result.pdispVal, form, Qnil) : Qnil;
  if (result.vt == VT_BSTR) {
    const VALUE text = FromVariant(result, form);
    SysFreeString(result.bstrVal);
    return text;
  }
  ResultConversion conversion = {&call, form};
  const VALUE data = reinterpret_cast<VALUE>(&conversion);
  const bool holdsObjects = (result.vt & VT_ARRAY) != 0 || result.vt == VT_UNKNOWN;
  return holdsObjects ? rb_ensure(ConvertResult, data, ClearOnHost, data) : ConvertResult(data);
}

// Drops the result of a call that returned just before the macro was interrupted. Objects of the
// host are released together with other unused ones.
void DropResult(Invocation& call, TextForm form) {
  call.FreeException();
  if (call.result.vt == VT_DISPATCH)
    TakeResult(call, form);
  else if (call.result.vt == VT_BSTR)
    SysFreeString(call.result.bstrVal);
}

// Fills COM's last-first order; the object keeps its own reference. False: no memory.
bool FillArguments(const Wrapped& wrapped, Invocation& call, const VALUE* arguments) {
  const int count = static_cast<int>(call.parameters.cArgs);
  for (int i = 0; i < count; ++i)
    if (!FillVariant(arguments[i], wrapped.form, call.parameters.rgvarg[count - 1 - i]))
      return false;
  return true;
}

// Calls with passable arguments. Between the first filled argument and the last cleared one nothing
// raises.
VALUE Invoke(const Wrapped& wrapped, VALUE name, DISPID id, WORD flags, int count,
             const VALUE* arguments) {
  VARIANT few[kFewArguments] = {};
  DISPID putId = DISPID_PROPERTYPUT;
  Invocation call;
  call.dispatch = wrapped.dispatch;
  call.id = id;
  call.flags = flags;
  call.parameters.cArgs = static_cast<UINT>(count);
  call.parameters.rgvarg = few;
  if (count > kFewArguments)
    call.parameters.rgvarg = static_cast<VARIANT*>(calloc(static_cast<size_t>(count), sizeof *few));
  if (!call.parameters.rgvarg) RaiseNoMemory();
  if (flags == DISPATCH_PROPERTYPUT) {
    call.parameters.cNamedArgs = 1;
    call.parameters.rgdispidNamedArgs = &putId;
  }
  const bool filled = FillArguments(wrapped, call, arguments);
  const bool goesOn = filled && Interpreter::CallHost(call);
  for (int i = 0; i < count; ++i) VariantClear(&call.parameters.rgvarg[i]);
  if (count > kFewArguments) free(call.parameters.rgvarg);
  if (!filled) RaiseNoMemory();
  if (!goesOn) {
    DropResult(call, wrapped.form);
    LeaveTask();
  }
  if (FAILED(call.outcome)) RaiseInvocationFailure(wrapped, name, call);
  return flags & DISPATCH_PROPERTYGET ? TakeResult(call, wrapped.form) : arguments[count - 1];
}

// The bridge of an 8-bit host leaves out what has no form there, and later arguments would move up.
void CheckPlaces(const VALUE* passable, int count) {
  for (int i = 0; i + 1 < count; ++i)
    if (NIL_P(passable[i]) || IsComObject(passable[i]))
      rb_raise(rb_eArgError, "argument %d is %s, which the editor would leave out", i + 1,
               NIL_P(passable[i]) ? "nil" : "an object");
}

VALUE InvokeWith(const Wrapped& wrapped, VALUE name, DISPID id, WORD flags, int count,
                 const VALUE* arguments) {
  if (rb_block_given_p()) rb_raise(rb_eArgError, "a call of a COM object takes no block");
  VALUE buffer = Qnil;
  VALUE* const passable = ALLOCV_N(VALUE, buffer, count + 1);
  for (int i = 0; i < count; ++i) passable[i] = ToVariantValue(arguments[i], wrapped.form);
  if (wrapped.form == TextForm::kBytes) CheckPlaces(passable, count);
  CheckCallable(wrapped);  // conversions may have run anything
  const VALUE result = Invoke(wrapped, name, id, flags, count, passable);
  ALLOCV_END(buffer);
  return result;
}

constexpr WORD kCallOrGet = DISPATCH_METHOD | DISPATCH_PROPERTYGET;

// object.name(arguments), object.name = value, and object.send(:name=, index, value).
VALUE MethodMissing(int count, VALUE* arguments, VALUE self) {
  Wrapped& wrapped = Unwrap(self);
  rb_check_arity(count, 1, UNLIMITED_ARGUMENTS);
  const VALUE symbol = arguments[0];
  const VALUE name = rb_sym2str(symbol);
  bool isSetter = false;
  const long length = NameLength(name, isSetter);
  if (length == 0) return rb_call_super(count, arguments);
  if (isSetter) rb_check_arity(count, 2, UNLIMITED_ARGUMENTS);  // the value, after any indexes
  CheckCallable(wrapped);
  VALUE id = rb_hash_lookup(wrapped.ids, symbol);
  if (NIL_P(id)) {
    DISPID found = DISPID_UNKNOWN;
    const HRESULT outcome = LookUp(wrapped, RSTRING_PTR(name), length, found);
    if (FAILED(outcome)) RaiseUnknown(wrapped, symbol, outcome);
    id = LONG2NUM(found);
    rb_hash_aset(wrapped.ids, symbol, id);
  }
  return InvokeWith(wrapped, symbol, static_cast<DISPID>(NUM2LONG(id)),
                    isSetter ? WORD{DISPATCH_PROPERTYPUT} : kCallOrGet, count - 1, arguments + 1);
}

// object[index]: the default property.
VALUE GetDefault(int count, VALUE* arguments, VALUE self) {
  const Wrapped& wrapped = Unwrap(self);
  CheckCallable(wrapped);
  return InvokeWith(wrapped, ID2SYM(rb_intern("[]")), DISPID_VALUE, kCallOrGet, count, arguments);
}

VALUE SetDefault(int count, VALUE* arguments, VALUE self) {
  const Wrapped& wrapped = Unwrap(self);
  rb_check_arity(count, 1, UNLIMITED_ARGUMENTS);
  CheckCallable(wrapped);
  return InvokeWith(wrapped, ID2SYM(rb_intern("[]=")), DISPID_VALUE, DISPATCH_PROPERTYPUT, count,
                    arguments);
}

// Whether the object knows the name. Ruby asks for conversions (to_str and the like) on many
// occasions; a host that reports unknown names to its user would report those.
VALUE Knows(VALUE self, VALUE symbol) {
  Wrapped& wrapped = Unwrap(self);
  if (!Interpreter::IsMainThread() || !wrapped.dispatch) return Qfalse;
  if (!NIL_P(rb_hash_lookup(wrapped.ids, symbol))) return Qtrue;
  const VALUE name = rb_sym2str(symbol);
  bool isSetter = false;
  const long length = NameLength(name, isSetter);
  DISPID id = DISPID_UNKNOWN;
  return length > 0 && SUCCEEDED(LookUp(wrapped, RSTRING_PTR(name), length, id)) ? Qtrue : Qfalse;
}

VALUE Name(VALUE self) { return Unwrap(self).name; }

VALUE IsSame(VALUE self, VALUE other) {
  return IsComObject(other) && DispatchOf(self) == DispatchOf(other) ? Qtrue : Qfalse;
}

}  // namespace

void DefineComObject(VALUE module) {
  comObjectClass = rb_define_class_under(module, "ComObject", rb_cObject);
  rb_undef_alloc_func(comObjectClass);
  rb_define_private_method(comObjectClass, "method_missing", MethodMissing, -1);
  rb_define_method(comObjectClass, "[]", GetDefault, -1);
  rb_define_method(comObjectClass, "[]=", SetDefault, -1);
  rb_define_private_method(comObjectClass, "__knows", Knows, 1);
  rb_define_private_method(comObjectClass, "__name", Name, 0);
  rb_define_method(comObjectClass, "==", IsSame, 1);
}

VALUE NewComObject(IDispatch* dispatch, TextForm form, VALUE name) {
  Wrapped* const wrapped = static_cast<Wrapped*>(calloc(1, sizeof(Wrapped)));
  if (!wrapped) RaiseNoMemory();
  *wrapped = {dispatch, Interpreter::Owner(), form, name, Qnil, nullptr, live};
  if (live) live->previous = wrapped;
  live = wrapped;
  const VALUE object = TypedData_Wrap_Struct(comObjectClass, &kType, wrapped);
  wrapped->ids = rb_hash_new();
  RB_GC_GUARD(name);
  return object;
}

bool IsComObject(VALUE value) { return rb_typeddata_is_kind_of(value, &kType); }

IDispatch* DispatchOf(VALUE object) { return Unwrap(object).dispatch; }

void ReleaseCollectedObjects() {
  while (Wrapped* const wrapped = collected) {
    collected = wrapped->next;
    if (wrapped->dispatch) wrapped->dispatch->Release();
    free(wrapped);
  }
  RunDeferredCalls();
}

// A release may run the host's code, which may change the list: each search starts from the
// beginning.
void ReleaseObjectsOf(const void* owner) {
  for (Wrapped* each = live; each;) {
    if (each->owner != owner || !each->dispatch) {
      each = each->next;
      continue;
    }
    IDispatch* const dispatch = each->dispatch;
    each->dispatch = nullptr;
    dispatch->Release();
    each = live;
  }
}
