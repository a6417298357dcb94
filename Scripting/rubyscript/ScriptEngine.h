// SPDX-License-Identifier: MIT
// The script engine: Active Scripting's IActiveScript and IActiveScriptParse for Ruby. It keeps the
// states, the named items and the site; everything in Ruby is a MacroTask.
//
// Named items appear as instance variables of the macro's top-level object: the item "tarn" is
// `@tarn`. A host whose items include "tarn" and whose first text can be bytes of UTF-8 is taken for
// the 8-bit host that it then is (see TextCoding.h).
//
// Ownership: COM's. It holds the site from SetScriptSite to Close.
// Errors: HRESULTs as Active Scripting documents them. A script's own errors go to the site's
// OnScriptError; where the site takes one, the call answers SCRIPT_E_REPORTED.
// The host may call the engine back from what the engine calls; it may also leave its frames then by
// a jump or a fault, and need not come back. Closing waits for the outermost call to end, resetting is
// refused until then.
// Threading: the thread of SetScriptSite; others get E_UNEXPECTED. AddRef, Release, GetScriptSite,
// GetScriptState, InterruptScriptThread and the questions about threads may come from any thread.
//
// Next on the reader's path: MacroTask, Interpreter.
#pragma once

#include <oaidl.h>
// activscp.h must come after its base interfaces.
#include <activscp.h>
#include <objsafe.h>

#include "MacroTask.h"

HRESULT CreateScriptEngine(REFIID riid, void** object);

class ScriptEngine final : public IActiveScript, public IActiveScriptParse, public IObjectSafety {
 public:
  explicit ScriptEngine(EngineState* newState);  // takes it over
  ScriptEngine(const ScriptEngine&) = delete;
  ScriptEngine& operator=(const ScriptEngine&) = delete;

  STDMETHODIMP QueryInterface(REFIID riid, void** object) override;
  STDMETHODIMP_(ULONG) AddRef() override;
  STDMETHODIMP_(ULONG) Release() override;

  // IActiveScript
  STDMETHODIMP SetScriptSite(IActiveScriptSite* newSite) override;
  STDMETHODIMP GetScriptSite(REFIID riid, void** object) override;
  STDMETHODIMP SetScriptState(SCRIPTSTATE newState) override;
  STDMETHODIMP GetScriptState(SCRIPTSTATE* current) override;
  STDMETHODIMP Close() override;
  STDMETHODIMP AddNamedItem(LPCOLESTR name, DWORD flags) override;
  STDMETHODIMP AddTypeLib(REFGUID, DWORD, DWORD, DWORD) override { return E_NOTIMPL; }
  STDMETHODIMP GetScriptDispatch(LPCOLESTR itemName, IDispatch** dispatch) override;
  STDMETHODIMP GetCurrentScriptThreadID(SCRIPTTHREADID* thread) override;
  STDMETHODIMP GetScriptThreadID(DWORD systemThread, SCRIPTTHREADID* thread) override;
  STDMETHODIMP GetScriptThreadState(SCRIPTTHREADID thread, SCRIPTTHREADSTATE* current) override;
  STDMETHODIMP InterruptScriptThread(SCRIPTTHREADID thread, const EXCEPINFO* exception,
                                     DWORD) override;
  STDMETHODIMP Clone(IActiveScript**) override { return E_NOTIMPL; }

  // IActiveScriptParse
  STDMETHODIMP InitNew() override;
  STDMETHODIMP AddScriptlet(LPCOLESTR, LPCOLESTR, LPCOLESTR, LPCOLESTR, LPCOLESTR, LPCOLESTR, DWORD,
                            ULONG, DWORD, BSTR*, EXCEPINFO*) override {
    return E_NOTIMPL;
  }
  STDMETHODIMP ParseScriptText(LPCOLESTR code, LPCOLESTR itemName, IUnknown* context,
                               LPCOLESTR delimiter, DWORD cookie, ULONG firstLine, DWORD flags,
                               VARIANT* result, EXCEPINFO* exception) override;

  // IObjectSafety: a macro can do whatever its user can, so nothing is claimed.
  STDMETHODIMP GetInterfaceSafetyOptions(REFIID riid, DWORD* supported, DWORD* enabled) override;
  STDMETHODIMP SetInterfaceSafetyOptions(REFIID riid, DWORD mask, DWORD options) override;

  // For ScriptDispatch. `name` is the function's; the out-parameters may be null.
  HRESULT Defines(LPCOLESTR name);
  HRESULT CallFunction(LPCOLESTR name, const DISPPARAMS* arguments, VARIANT* result,
                       EXCEPINFO* exception);
  // Host side of the interpreter's thread: enters Ruby for the engine whose address is `owner`.
  // CO_E_OBJNOTCONNECTED: there is no such engine, or it runs no code.
  static HRESULT CallBack(const void* owner, unsigned long (*body)(unsigned long),
                          unsigned long data);

 private:
  ~ScriptEngine();
  class Call;
  bool IsUsable() const;
  bool IsStarted() const;
  const NamedItem* FindItem(LPCOLESTR name) const;
  HRESULT RequestItems();
  HRESULT Start(SCRIPTSTATE newState);
  MacroTask* NewTask(MacroTask::Kind kind, LPCOLESTR text);
  HRESULT Perform(MacroTask* task, VARIANT* result, EXCEPINFO* exception);
  HRESULT Enter(MacroTask* task, EXCEPINFO* exception);
  HRESULT Report(ScriptError* error, EXCEPINFO* exception);
  HRESULT RunQueue(VARIANT* result, EXCEPINFO* exception);
  void ChangeState(SCRIPTSTATE newState);
  void LowerState(SCRIPTSTATE newState);
  void Reset(bool all);
  void FinishClose();

  LONG references = 1;
  ScriptEngine* next = nullptr;  // in the list of all
  IActiveScriptSite* site = nullptr;
  DWORD thread = 0;  // of SetScriptSite; 0 before
  SCRIPTSTATE state = SCRIPTSTATE_UNINITIALIZED;
  bool initialized = false;  // InitNew has been called
  bool textFormKnown = false;
  int calls = 0;         // of the host that are under way and may call it back
  bool closing = false;  // as soon as the last of them has ended
  NamedItem* items = nullptr;
  EngineState* const engineState;  // outlives an engine that cannot enter the interpreter any more
};
