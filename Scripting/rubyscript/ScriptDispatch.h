// SPDX-License-Identifier: MIT
// The functions of a macro, for the host to call: what the macro has defined at its top level, by
// name. Names become numbers in the order in which they are first asked for.
//
// Ownership: COM's; keeps its engine alive. After the engine has been closed calls answer
// E_UNEXPECTED. Threading: the engine's thread; AddRef and Release any.
#pragma once

#include <windows.h>
// Needs windows.h before it.
#include <oleauto.h>

class ScriptEngine;

class ScriptDispatch final : public IDispatch {
 public:
  explicit ScriptDispatch(ScriptEngine* owner);
  ScriptDispatch(const ScriptDispatch&) = delete;
  ScriptDispatch& operator=(const ScriptDispatch&) = delete;

  STDMETHODIMP QueryInterface(REFIID riid, void** object) override;
  STDMETHODIMP_(ULONG) AddRef() override;
  STDMETHODIMP_(ULONG) Release() override;
  STDMETHODIMP GetTypeInfoCount(UINT* count) override;
  STDMETHODIMP GetTypeInfo(UINT, LCID, ITypeInfo** info) override;
  STDMETHODIMP GetIDsOfNames(REFIID riid, LPOLESTR* names, UINT count, LCID, DISPID* ids) override;
  STDMETHODIMP Invoke(DISPID id, REFIID riid, LCID, WORD flags, DISPPARAMS* parameters,
                      VARIANT* result, EXCEPINFO* exception, UINT* badArgument) override;

 private:
  ~ScriptDispatch();
  struct Name {
    BSTR text;
    Name* next;
  };

  LONG references = 1;
  ScriptEngine* const engine;
  Name* names = nullptr;  // the number of a name is its place, from 1
};
