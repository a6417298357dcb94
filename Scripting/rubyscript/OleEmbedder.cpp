// SPDX-License-Identifier: MIT
#include "OleEmbedder.h"

#include <stdlib.h>

#include "Interpreter.h"
#include "RubyRuntime.h"
#include "ScriptEngine.h"
// Last: they rename what the headers above use.
#include <ruby/thread.h>

#include "RubyCall.h"

// Exported by CRuby for its extensions; no header of the embedding interface declares it.
extern "C" int ruby_thread_has_gvl_p(void);

namespace {

struct FunctionCall final : HostCall {
  void (*function)(void*) = nullptr;
  void* data = nullptr;

  void Run() override {
    RunDeferredCalls();
    function(data);
  }
};

int CallOut(void (*function)(void*), void* data) {
  if (!Interpreter::IsMainThread()) {
    function(data);
    return 1;
  }
  FunctionCall call;
  call.function = function;
  call.data = data;
  return Interpreter::CallHost(call);
}

// On the host's stack a task of the owner; on a stack of Ruby's the code that is there goes on.
HRESULT CallIn(const void* owner, VALUE (*body)(VALUE), VALUE data) {
  if (Interpreter::FatalExceptionCode()) return E_ABORT;
  if (Interpreter::IsMainThread() && !Interpreter::IsRubySide())
    return ScriptEngine::CallBack(owner, body, data);
  if (!IsRubyThread() || !ruby_thread_has_gvl_p()) return RPC_E_WRONG_THREAD;
  if (rb_during_gc()) return E_UNEXPECTED;
  VALUE ignored;
  return Protect(body, data, ignored) == Outcome::kDone ? S_OK : E_ABORT;
}

const void* Owner() { return Interpreter::TaskNumber() ? Interpreter::Owner() : nullptr; }

int MustLeave() { return Interpreter::IsMainThread() && Interpreter::MustEnd(); }

void Leave() { LeaveTask(); }

struct Deferred {
  void (*function)(void*);
  void* data;
  Deferred* next;
};

Deferred* deferred = nullptr;

// Without memory the reference is lost, which is better than a call while garbage is collected.
void Defer(void (*function)(void*), void* data) {
  Deferred* const call = static_cast<Deferred*>(malloc(sizeof(Deferred)));
  if (!call) return;
  *call = {function, data, deferred};
  deferred = call;
}

// The layout is win32ole's.
struct Embedder {
  unsigned size = sizeof(Embedder);
  int (*callOut)(void (*)(void*), void*) = CallOut;
  HRESULT (*callIn)(const void*, VALUE (*)(VALUE), VALUE) = CallIn;
  const void* (*owner)() = Owner;
  int (*mustLeave)() = MustLeave;
  void (*leave)() = Leave;
  void (*later)(void (*)(void*), void*) = Defer;
};

VALUE EmbedderAddress(VALUE) {
  static constexpr Embedder embedder;
  return ULONG2NUM(reinterpret_cast<unsigned long>(&embedder));
}

}  // namespace

void DefineOleEmbedder(VALUE module) {
  rb_define_singleton_method(module, "ole_embedder", EmbedderAddress, 0);
}

void CloseOleObjects() {
  const ID name = rb_intern("WIN32OLE");
  if (!rb_const_defined(rb_cObject, name)) return;
  VALUE ignored;
  Send(rb_const_get(rb_cObject, name), "__close", 0, nullptr, ignored);
}

// A call may run the host's code, and that put off others.
void RunDeferredCalls() {
  while (Deferred* const call = deferred) {
    deferred = call->next;
    call->function(call->data);
    free(call);
  }
}
