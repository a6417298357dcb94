// SPDX-License-Identifier: MIT
#include "host/WatchedEngine.h"

HRESULT WatchedEngine::QueryInterface(REFIID riid, void** object) {
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

ULONG WatchedEngine::AddRef() { return static_cast<ULONG>(InterlockedIncrement(&references)); }

ULONG WatchedEngine::Release() {
  const LONG left = InterlockedDecrement(&references);
  if (left > 0) return static_cast<ULONG>(left);
  owner.Going(this);
  parser->Release();
  engine->Release();
  delete this;
  return 0;
}

HRESULT WatchedEngine::SetScriptSite(IActiveScriptSite* site) {
  return engine->SetScriptSite(site);
}

HRESULT WatchedEngine::GetScriptSite(REFIID riid, void** object) {
  return engine->GetScriptSite(riid, object);
}

HRESULT WatchedEngine::SetScriptState(SCRIPTSTATE state) { return engine->SetScriptState(state); }

HRESULT WatchedEngine::GetScriptState(SCRIPTSTATE* state) { return engine->GetScriptState(state); }

HRESULT WatchedEngine::Close() { return engine->Close(); }

HRESULT WatchedEngine::AddNamedItem(LPCOLESTR name, DWORD flags) {
  return engine->AddNamedItem(name, flags);
}

HRESULT WatchedEngine::AddTypeLib(REFGUID library, DWORD major, DWORD minor, DWORD flags) {
  return engine->AddTypeLib(library, major, minor, flags);
}

HRESULT WatchedEngine::GetScriptDispatch(LPCOLESTR item, IDispatch** dispatch) {
  return engine->GetScriptDispatch(item, dispatch);
}

HRESULT WatchedEngine::GetCurrentScriptThreadID(SCRIPTTHREADID* thread) {
  return engine->GetCurrentScriptThreadID(thread);
}

HRESULT WatchedEngine::GetScriptThreadID(DWORD systemThread, SCRIPTTHREADID* thread) {
  return engine->GetScriptThreadID(systemThread, thread);
}

HRESULT WatchedEngine::GetScriptThreadState(SCRIPTTHREADID thread, SCRIPTTHREADSTATE* state) {
  return engine->GetScriptThreadState(thread, state);
}

HRESULT WatchedEngine::InterruptScriptThread(SCRIPTTHREADID thread, const EXCEPINFO* exception,
                                             DWORD flags) {
  return engine->InterruptScriptThread(thread, exception, flags);
}

HRESULT WatchedEngine::Clone(IActiveScript** copy) { return engine->Clone(copy); }

HRESULT WatchedEngine::InitNew() { return parser->InitNew(); }

HRESULT WatchedEngine::AddScriptlet(LPCOLESTR defaultName, LPCOLESTR code, LPCOLESTR item,
                                    LPCOLESTR subItem, LPCOLESTR event, LPCOLESTR delimiter,
                                    DWORD context, ULONG line, DWORD flags, BSTR* name,
                                    EXCEPINFO* exception) {
  return parser->AddScriptlet(defaultName, code, item, subItem, event, delimiter, context, line,
                              flags, name, exception);
}

HRESULT WatchedEngine::ParseScriptText(LPCOLESTR code, LPCOLESTR item, IUnknown* context,
                                       LPCOLESTR delimiter, DWORD cookie, ULONG line, DWORD flags,
                                       VARIANT* result, EXCEPINFO* exception) {
  return parser->ParseScriptText(code, item, context, delimiter, cookie, line, flags, result,
                                 exception);
}
