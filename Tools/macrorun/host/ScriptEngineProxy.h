// SPDX-License-Identifier: MIT
// Proxy of a script engine that notifies its owner on final release. The owner holds no reference:
// that would keep the engine longer than the script site, which the engine calls when it is
// destroyed.
//
// Ownership: by COM references; it holds the real engine. Errors: those of the real engine.
// Threading: the real engine's.
#pragma once

#include <activscp.h>
#include <windows.h>

// The 32-bit parser interface. Libraries do not define its identifier under the header's name.
inline constexpr IID kActiveScriptParse = {
    0xBB1A2AE2, 0xA4F9, 0x11CF, {0x8F, 0x20, 0x00, 0x80, 0x5F, 0x2C, 0xD0, 0x64}};

class ScriptEngineProxy final : public IActiveScript, public IActiveScriptParse {
 public:
  class Owner {
   public:
    virtual ~Owner() = default;
    // Called before the engine is released. After it returns, the owner must not use the engine.
    virtual void OnReleased(ScriptEngineProxy* engine) = 0;
  };

  // Takes over both references. The owner outlives the object.
  ScriptEngineProxy(IActiveScript* realEngine, IActiveScriptParse* realParser, Owner& engineOwner)
      : engine(realEngine), parser(realParser), owner(engineOwner) {}
  ScriptEngineProxy(const ScriptEngineProxy&) = delete;
  ScriptEngineProxy& operator=(const ScriptEngineProxy&) = delete;

  STDMETHODIMP QueryInterface(REFIID riid, void** object) override;
  STDMETHODIMP_(ULONG) AddRef() override;
  STDMETHODIMP_(ULONG) Release() override;

  // IActiveScript
  STDMETHODIMP SetScriptSite(IActiveScriptSite* site) override;
  STDMETHODIMP GetScriptSite(REFIID riid, void** object) override;
  STDMETHODIMP SetScriptState(SCRIPTSTATE state) override;
  STDMETHODIMP GetScriptState(SCRIPTSTATE* state) override;
  STDMETHODIMP Close() override;
  STDMETHODIMP AddNamedItem(LPCOLESTR name, DWORD flags) override;
  STDMETHODIMP AddTypeLib(REFGUID library, DWORD major, DWORD minor, DWORD flags) override;
  STDMETHODIMP GetScriptDispatch(LPCOLESTR item, IDispatch** dispatch) override;
  STDMETHODIMP GetCurrentScriptThreadID(SCRIPTTHREADID* thread) override;
  STDMETHODIMP GetScriptThreadID(DWORD systemThread, SCRIPTTHREADID* thread) override;
  STDMETHODIMP GetScriptThreadState(SCRIPTTHREADID thread, SCRIPTTHREADSTATE* state) override;
  STDMETHODIMP InterruptScriptThread(SCRIPTTHREADID thread, const EXCEPINFO* exception,
                                     DWORD flags) override;
  STDMETHODIMP Clone(IActiveScript** copy) override;

  // IActiveScriptParse
  STDMETHODIMP InitNew() override;
  STDMETHODIMP AddScriptlet(LPCOLESTR defaultName, LPCOLESTR code, LPCOLESTR item,
                            LPCOLESTR subItem, LPCOLESTR event, LPCOLESTR delimiter, DWORD context,
                            ULONG line, DWORD flags, BSTR* name, EXCEPINFO* exception) override;
  STDMETHODIMP ParseScriptText(LPCOLESTR code, LPCOLESTR item, IUnknown* context,
                               LPCOLESTR delimiter, DWORD cookie, ULONG line, DWORD flags,
                               VARIANT* result, EXCEPINFO* exception) override;

 private:
  ~ScriptEngineProxy() = default;

  LONG references = 1;
  IActiveScript* const engine;
  IActiveScriptParse* const parser;
  Owner& owner;
};
