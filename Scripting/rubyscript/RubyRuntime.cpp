// SPDX-License-Identifier: MIT
#include "RubyRuntime.h"

#include <io.h>

#include "Interpreter.h"
#include "ProcessGuards.h"
#include "ProcessStateSnapshot.h"
// Last: they rename what the headers above use.
#include <ruby/encoding.h>
#include "ClassSnapshot.h"
#include "ComObject.h"
#include "OleEmbedder.h"
#include "RubyCall.h"
#include "RubyInternals.h"
#include "VariantConversion.h"

namespace {

// The engine's Ruby part, in the order in which its files need each other.
constexpr char kHostObjects[] = {
#embed "prelude/host_objects.rb"
};
constexpr char kHostOutput[] = {
#embed "prelude/host_output.rb"
};
constexpr char kSuggestions[] = {
#embed "prelude/suggestions.rb"
};
constexpr char kContext[] = {
#embed "prelude/context.rb"
};
constexpr char kProcessGuards[] = {
#embed "prelude/process_guards.rb"
};
constexpr char kGlobalsSnapshot[] = {
#embed "prelude/globals_snapshot.rb"
};

struct PreludeFile {
  const char* name;
  const char* text;
  long bytes;
};

// The last one takes stock of what there is before any macro.
constexpr PreludeFile kPrelude[] = {
    {"rubyscript/host_objects.rb", kHostObjects, sizeof kHostObjects},
    {"rubyscript/host_output.rb", kHostOutput, sizeof kHostOutput},
    {"rubyscript/process_guards.rb", kProcessGuards, sizeof kProcessGuards},
    {"rubyscript/suggestions.rb", kSuggestions, sizeof kSuggestions},
    {"rubyscript/context.rb", kContext, sizeof kContext},
    {"rubyscript/globals_snapshot.rb", kGlobalsSnapshot, sizeof kGlobalsSnapshot},
};

// The state at the start; keeps the variables that CRuby has added. No block of the heap: a start that
// fails for want of one would be the last.
[[clang::no_destroy]] constinit ProcessStateSnapshot startState;

VALUE SystemMessage(VALUE, VALUE code) {
  wchar_t text[512];
  const DWORD units =
      FormatMessageW(FORMAT_MESSAGE_FROM_SYSTEM | FORMAT_MESSAGE_IGNORE_INSERTS, nullptr,
                     static_cast<DWORD>(NUM2ULONG(code)), 0, text, 512, nullptr);
  if (units == 0) return rb_utf8_str_new_cstr("failed");
  return StringFromHost(text, units, TextForm::kUtf16, TextOrigin::kResult);
}

VALUE CanCall(VALUE) {
  return Interpreter::IsMainThread() && !Interpreter::MustEnd() ? Qtrue : Qfalse;
}

VALUE LowestDescriptor(VALUE) {
  int descriptor = 0;
  while (_get_osfhandle(descriptor) != -1) ++descriptor;
  return INT2FIX(descriptor);
}

// Where the thread keeps the object that is `self` at the top level of the next code. CRuby has it
// changed by `load` alone; it is found by its value, which no other field of the thread has.
VALUE* TopSelfSlot() {
  static VALUE* slot = nullptr;
  if (slot) return slot;
  constexpr int kFields = 32;  // of which it is about the tenth
  const VALUE main =
      rb_funcall(rb_const_get(rb_cObject, rb_intern("TOPLEVEL_BINDING")), rb_intern("receiver"), 0);
  VALUE* const fields = static_cast<VALUE*>(RTYPEDDATA_DATA(rb_thread_current()));
  for (int i = 0; i < kFields && !slot; ++i)
    if (fields[i] == main) slot = &fields[i];
  if (!slot) rb_raise(rb_eNotImpError, "this CRuby keeps its top-level object elsewhere");
  return slot;
}

// TOPLEVEL_BINDING begins with the same object, which `eval` and ERB use.
VALUE SetTopSelf(VALUE, VALUE object) {
  static const VALUE binding = rb_const_get(rb_cObject, rb_intern("TOPLEVEL_BINDING"));
  *TopSelfSlot() = object;
  RB_OBJ_WRITE(binding, static_cast<VALUE*>(RTYPEDDATA_DATA(binding)), object);
  return object;
}

// Replaces the label "<compiled>" of a code by "<main>". CRuby has no setter: the label is found in the
// code's structure by its value. Blocks keep "block in <compiled>": asking for them leaks memory in CRuby.
VALUE LabelAsMain(VALUE, VALUE code) {
  constexpr int kFields = 40;  // of which it is about the twentieth
  VALUE* const iseq = static_cast<VALUE*>(const_cast<void*>(rb_iseqw_to_iseq(code)));
  VALUE* const fields = reinterpret_cast<VALUE*>(iseq[2]);
  const VALUE label = rb_funcall(code, rb_intern("label"), 0);
  const VALUE name = rb_str_freeze(rb_str_new_cstr("<main>"));
  for (int i = 0; i < kFields; ++i)
    if (fields[i] == label) RB_OBJ_WRITE(reinterpret_cast<VALUE>(iseq), &fields[i], name);
  return Qnil;
}

// `rescue` asks this. No class of exceptions takes the end of an interrupted macro.
VALUE TakesException(VALUE exceptionClass, VALUE object) {
  if (rb_obj_class(object) == StopClass()) return exceptionClass == StopClass() ? Qtrue : Qfalse;
  return rb_obj_is_kind_of(object, exceptionClass);
}

// CRuby ends a Ractor with its main thread.
VALUE EndRactor(VALUE, VALUE ractor) {
  const VALUE threads = rb_ractor_thread_list(RTYPEDDATA_DATA(ractor));
  for (long i = 0; i < RARRAY_LEN(threads); ++i) rb_thread_kill(rb_ary_entry(threads, i));
  return Qnil;
}

VALUE Global(VALUE, VALUE name) { return rb_gv_get(rb_id2name(SYM2ID(name))); }

VALUE SetGlobal(VALUE, VALUE name, VALUE value) {
  return rb_gv_set(rb_id2name(SYM2ID(name)), value);
}

// CRuby would load the encoding under a lock. In a process that has had Ractors it keeps the lock, and
// the next thread waits for it without end.
VALUE SetDefaultExternal(VALUE, VALUE encoding) {
  rb_warning("setting Encoding.default_external");
  if (!NIL_P(encoding)) rb_to_encoding(encoding);
  rb_enc_set_default_external(encoding);
  return encoding;
}

VALUE SetDefaultInternal(VALUE, VALUE encoding) {
  rb_warning("setting Encoding.default_internal");
  if (!NIL_P(encoding)) rb_to_encoding(encoding);
  rb_enc_set_default_internal(encoding);
  return encoding;
}

constexpr const char* kCompaction[] = {"compact", "auto_compact=", "verify_compaction_references"};

VALUE DefineModule(VALUE) {
  const VALUE module = rb_define_module("ActiveScript");
  rb_define_singleton_method(module, "system_message", SystemMessage, 1);
  rb_define_singleton_method(module, "can_call?", CanCall, 0);
  rb_define_singleton_method(module, "lowest_descriptor", LowestDescriptor, 0);
  rb_define_singleton_method(module, "top_self=", SetTopSelf, 1);
  rb_define_singleton_method(module, "label_as_main", LabelAsMain, 1);
  rb_define_singleton_method(module, "global", Global, 1);
  rb_define_singleton_method(module, "set_global", SetGlobal, 2);
  rb_define_singleton_method(module, "end_ractor", EndRactor, 1);
  rb_ext_ractor_safe(true);  // Ractors use `rescue`
  rb_define_singleton_method(rb_eException, "===", TakesException, 1);
  rb_ext_ractor_safe(false);
  DefineProcessGuards();
  DefineComObject(module);
  DefineOleEmbedder(module);
  const VALUE binding = rb_const_get(rb_cObject, rb_intern("TOPLEVEL_BINDING"));
  for (const PreludeFile& file : kPrelude)
    rb_funcall(binding, rb_intern("eval"), 3, rb_utf8_str_new(file.text, file.bytes),
               rb_utf8_str_new_cstr(file.name), INT2FIX(1));
  // It moves objects that native code holds.
  for (const char* const name : kCompaction)
    rb_define_singleton_method(rb_mGC, name, rb_f_notimplement, -1);
  rb_define_singleton_method(rb_cEncoding, "default_external=", SetDefaultExternal, 1);
  rb_define_singleton_method(rb_cEncoding, "default_internal=", SetDefaultInternal, 1);
  ClassSnapshot::Start();
  return Qnil;
}

// With these options CRuby reads nothing of the host's command line and environment.
bool StartInterpreter() {
  static char name[] = "macro";
  static char options[] = "--disable=gems,rubyopt";
  static char execute[] = "-e";
  static char nothing[] = "";
  static char* arguments[] = {name, options, execute, nothing, nullptr};
  int count = 4;
  char** list = arguments;
  ruby_sysinit(&count, &list);
  RUBY_INIT_STACK;
  if (ruby_setup() != 0) return false;
  list = arguments;
  void* const node = ruby_options(4, list);
  int status = 0;
  if (!ruby_executable_node(node, &status)) return false;
  ruby_script(name);
  return true;
}

}  // namespace

bool StartRuby() {
  startState.Save();
  _putenv("RUBYLIB=");
  bool started = StartInterpreter();
  if (started) {
    int failed = 0;
    rb_protect(DefineModule, Qnil, &failed);
    started = failed == 0;
  }
  startState.KeepAdditions();
  startState.Restore();
  return started;
}

void ApplyRubyEnvironment() { startState.ApplyAdditions(); }

bool IsRubyThread() { return ruby_native_thread_p() != 0; }

bool IsRubyCode(const void* address) {
  constexpr DWORD kByAddress =
      GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS | GET_MODULE_HANDLE_EX_FLAG_UNCHANGED_REFCOUNT;
  HMODULE owner = nullptr;
  return !GetModuleHandleExW(kByAddress, static_cast<const wchar_t*>(address), &owner) ||
         owner == GetModuleHandleW(L"msvcrt-ruby310.dll");
}

void EndRubyThread() {
  rb_thread_kill(rb_thread_current());
  ExitThread(0);
}
