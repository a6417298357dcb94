// SPDX-License-Identifier: MIT
// One error of a script, as the site gets it. Holds its own copies, so it outlives the call that
// reports it and the engine; every GetExceptionInfo gives fresh strings.
//
// Ownership: COM's; created with one reference. Threading: any.
#pragma once

#include <oaidl.h>
// activscp.h must come after its base interfaces.
#include <activscp.h>

class ScriptError final : public IActiveScriptError {
 public:
  // Line and column count from 0. Takes over both texts; null counts as empty. The context is the
  // cookie that came with the source.
  ScriptError(HRESULT code, BSTR description, ULONG line, LONG column, BSTR lineText,
              DWORD context);

  // Null: no information. Fills fresh strings, which the caller frees.
  void Fill(EXCEPINFO* exception) const;

  STDMETHODIMP QueryInterface(REFIID riid, void** object) override;
  STDMETHODIMP_(ULONG) AddRef() override;
  STDMETHODIMP_(ULONG) Release() override;
  STDMETHODIMP GetExceptionInfo(EXCEPINFO* exception) override;
  STDMETHODIMP GetSourcePosition(DWORD* sourceContext, ULONG* lineNumber,
                                 LONG* characterPosition) override;
  STDMETHODIMP GetSourceLineText(BSTR* text) override;

 private:
  ~ScriptError();

  LONG references = 1;
  const HRESULT code;
  const BSTR description;
  const ULONG line;
  const LONG column;
  const BSTR lineText;
  const DWORD context;
};
