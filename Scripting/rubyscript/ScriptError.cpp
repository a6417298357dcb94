// SPDX-License-Identifier: MIT
#include "ScriptError.h"

#include <oleauto.h>

ScriptError::~ScriptError() {
  SysFreeString(details.description);
  SysFreeString(details.lineText);
  SysFreeString(details.helpFile);
}

static BSTR Copy(BSTR text) { return SysAllocStringLen(text, SysStringLen(text)); }

void ScriptError::Fill(EXCEPINFO* exception) const {
  if (!exception) return;
  *exception = {};
  exception->bstrSource = SysAllocString(L"RubyScript");
  exception->bstrDescription = Copy(details.description);
  exception->scode = details.code;
  exception->wCode = details.wCode;
  if (details.helpFile) exception->bstrHelpFile = Copy(details.helpFile);
  exception->dwHelpContext = details.helpContext;
}

HRESULT ScriptError::QueryInterface(REFIID riid, void** object) {
  if (!object) return E_POINTER;
  const bool known = riid == IID_IUnknown || riid == __uuidof(IActiveScriptError);
  *object = known ? this : nullptr;
  if (!known) return E_NOINTERFACE;
  AddRef();
  return S_OK;
}

ULONG ScriptError::AddRef() { return static_cast<ULONG>(InterlockedIncrement(&references)); }

ULONG ScriptError::Release() {
  const LONG left = InterlockedDecrement(&references);
  if (left == 0) delete this;
  return static_cast<ULONG>(left);
}

HRESULT ScriptError::GetExceptionInfo(EXCEPINFO* exception) {
  if (!exception) return E_POINTER;
  Fill(exception);
  return S_OK;
}

HRESULT ScriptError::GetSourcePosition(DWORD* sourceContext, ULONG* lineNumber,
                                       LONG* characterPosition) {
  if (sourceContext) *sourceContext = details.context;
  if (lineNumber) *lineNumber = details.line;
  if (characterPosition) *characterPosition = details.column;
  return S_OK;
}

HRESULT ScriptError::GetSourceLineText(BSTR* text) {
  if (!text) return E_POINTER;
  *text = Copy(details.lineText);
  return *text ? S_OK : E_OUTOFMEMORY;
}
