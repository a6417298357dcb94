// SPDX-License-Identifier: MIT
#include "host/EngineFactory.h"

EngineFactory& EngineFactory::Instance() {
  static EngineFactory factory;
  return factory;
}

HRESULT EngineFactory::QueryInterface(REFIID riid, void** object) {
  if (!object) return E_POINTER;
  const bool known = riid == IID_IUnknown || riid == IID_IClassFactory;
  *object = known ? static_cast<IClassFactory*>(this) : nullptr;
  return known ? S_OK : E_NOINTERFACE;
}

HRESULT EngineFactory::CreateInstance(IUnknown* outer, REFIID riid, void** object) {
  if (!object) return E_POINTER;
  *object = nullptr;
  if (outer) return CLASS_E_NOAGGREGATION;
  return source ? source->Create(riid, object) : CO_E_CLASSSTRING;
}

// The manifest inside macrorun.exe names the program as the engine's server.
extern "C" HRESULT __stdcall DllGetClassObject(REFCLSID, REFIID riid, void** object) {
  return EngineFactory::Instance().QueryInterface(riid, object);
}
