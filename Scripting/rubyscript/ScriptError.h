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
  struct Details {
    HRESULT code = E_FAIL;
    BSTR description = nullptr;  // texts are owned; null counts as empty
    ULONG line = 0;              // from 0, as the column
    LONG column = 0;             // in UTF-16 units of the line as the host has it
    BSTR lineText = nullptr;
    DWORD context = 0;  // the cookie that came with the source
    WORD wCode = 0;     // this and the help are a failed call's
    BSTR helpFile = nullptr;
    DWORD helpContext = 0;
  };
  // Takes over the texts.
  explicit ScriptError(const Details& errorDetails) : details(errorDetails) {}

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
  const Details details;
};
