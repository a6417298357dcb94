// SPDX-License-Identifier: MIT
#include "host/ScriptEngineProxy.h"

HRESULT ScriptEngineProxy::QueryInterface(REFIID riid, void** object) {
  if (!object) return E_POINTER;
  if (riid == IID_IUnknown || riid == IID_IActiveScript)
    *object = static_cast<IActiveScript*>(this);
  else if (riid == kActiveScriptParse)
    *object = static_cast<IActiveScriptParse*>(this);
  else
    return engine->QueryInterface(riid, object);
  AddRef();
  return S_OK;
}

ULONG ScriptEngineProxy::AddRef() { return static_cast<ULONG>(InterlockedIncrement(&references)); }

ULONG ScriptEngineProxy::Release() {
  const LONG left = InterlockedDecrement(&references);
  if (left > 0) return static_cast<ULONG>(left);
  owner.OnReleased(this);
  parser->Release();
  engine->Release();
  delete this;
  return 0;
}

HRESULT ScriptEngineProxy::SetScriptSite(IActiveScriptSite* site) {
  return engine->SetScriptSite(site);
}

HRESULT ScriptEngineProxy::GetScriptSite(REFIID riid, void** object) {
  return engine->GetScriptSite(riid, object);
}

HRESULT ScriptEngineProxy::SetScriptState(SCRIPTSTATE state) {
  return engine->SetScriptState(state);
}

HRESULT ScriptEngineProxy::GetScriptState(SCRIPTSTATE* state) {
  return engine->GetScriptState(state);
}

HRESULT ScriptEngineProxy::Close() { return engine->Close(); }

HRESULT ScriptEngineProxy::AddNamedItem(LPCOLESTR name, DWORD flags) {
  return engine->AddNamedItem(name, flags);
}

HRESULT ScriptEngineProxy::AddTypeLib(REFGUID library, DWORD major, DWORD minor, DWORD flags) {
  return engine->AddTypeLib(library, major, minor, flags);
}

HRESULT ScriptEngineProxy::GetScriptDispatch(LPCOLESTR item, IDispatch** dispatch) {
  return engine->GetScriptDispatch(item, dispatch);
}

HRESULT ScriptEngineProxy::GetCurrentScriptThreadID(SCRIPTTHREADID* thread) {
  return engine->GetCurrentScriptThreadID(thread);
}

HRESULT ScriptEngineProxy::GetScriptThreadID(DWORD systemThread, SCRIPTTHREADID* thread) {
  return engine->GetScriptThreadID(systemThread, thread);
}

HRESULT ScriptEngineProxy::GetScriptThreadState(SCRIPTTHREADID thread, SCRIPTTHREADSTATE* state) {
  return engine->GetScriptThreadState(thread, state);
}

HRESULT ScriptEngineProxy::InterruptScriptThread(SCRIPTTHREADID thread, const EXCEPINFO* exception,
                                                 DWORD flags) {
  return engine->InterruptScriptThread(thread, exception, flags);
}

HRESULT ScriptEngineProxy::Clone(IActiveScript** copy) { return engine->Clone(copy); }

HRESULT ScriptEngineProxy::InitNew() { return parser->InitNew(); }

HRESULT ScriptEngineProxy::AddScriptlet(LPCOLESTR defaultName, LPCOLESTR code, LPCOLESTR item,
                                        LPCOLESTR subItem, LPCOLESTR event, LPCOLESTR delimiter,
                                        DWORD context, ULONG line, DWORD flags, BSTR* name,
                                        EXCEPINFO* exception) {
  return parser->AddScriptlet(defaultName, code, item, subItem, event, delimiter, context, line,
                              flags, name, exception);
}

HRESULT ScriptEngineProxy::ParseScriptText(LPCOLESTR code, LPCOLESTR item, IUnknown* context,
                                           LPCOLESTR delimiter, DWORD cookie, ULONG line,
                                           DWORD flags, VARIANT* result, EXCEPINFO* exception) {
  return parser->ParseScriptText(code, item, context, delimiter, cookie, line, flags, result,
                                 exception);
}
