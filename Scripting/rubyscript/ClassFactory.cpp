// SPDX-License-Identifier: MIT
#include "ClassFactory.h"

#include "ScriptEngine.h"
#include "Server.h"

namespace {
class ClassFactory final : public IClassFactory {
 public:
  STDMETHODIMP QueryInterface(REFIID riid, void** object) override {
    if (!object) return E_POINTER;
    const bool known = riid == __uuidof(IUnknown) || riid == __uuidof(IClassFactory);
    *object = known ? this : nullptr;
    if (!known) return E_NOINTERFACE;
    AddServerReference();
    return S_OK;
  }
  STDMETHODIMP_(ULONG) AddRef() override {
    AddServerReference();
    return 1;
  }
  STDMETHODIMP_(ULONG) Release() override {
    ReleaseServerReference();
    return 1;
  }

  STDMETHODIMP CreateInstance(IUnknown* outer, REFIID riid, void** object) override {
    if (!object) return E_POINTER;
    *object = nullptr;
    return outer ? CLASS_E_NOAGGREGATION : CreateScriptEngine(riid, object);
  }
  STDMETHODIMP LockServer(BOOL lock) override {
    lock ? AddServerReference() : ReleaseServerReference();
    return S_OK;
  }
};
}  // namespace

IClassFactory* ScriptEngineFactory() {
  static constinit ClassFactory factory;
  return &factory;
}
