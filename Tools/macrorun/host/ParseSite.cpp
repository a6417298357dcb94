// SPDX-License-Identifier: MIT
#include "host/ParseSite.h"

#include <oleauto.h>

#include "platform/Encoding.h"

namespace {

void FreeTexts(EXCEPINFO& exception) {
  SysFreeString(exception.bstrSource);
  SysFreeString(exception.bstrDescription);
  SysFreeString(exception.bstrHelpFile);
}

}  // namespace

HRESULT ParseSite::QueryInterface(REFIID riid, void** object) {
  if (!object) return E_POINTER;
  const bool known = riid == IID_IUnknown || riid == IID_IActiveScriptSite;
  *object = known ? static_cast<IActiveScriptSite*>(this) : nullptr;
  return known ? S_OK : E_NOINTERFACE;
}

HRESULT ParseSite::OnScriptError(IActiveScriptError* scriptError) {
  if (!scriptError) return E_POINTER;
  if (error) return S_OK;
  error.emplace();
  error->kind = "script";
  error->file = macro;
  DWORD context = 0;
  ULONG line = 0;
  LONG column = -1;
  if (SUCCEEDED(scriptError->GetSourcePosition(&context, &line, &column))) {
    error->line = static_cast<int>(line) + 1;
    error->column = static_cast<int>(column) + 1;
  }
  BSTR source = nullptr;
  scriptError->GetSourceLineText(&source);
  error->source = BytesOf(source, SysStringLen(source));
  SysFreeString(source);
  error->columnInBytes = true;
  EXCEPINFO exception = {};
  scriptError->GetExceptionInfo(&exception);
  SetDescription(*error,
                 BytesOf(exception.bstrDescription, SysStringLen(exception.bstrDescription)));
  if (error->message.empty()) error->message = "syntax error";
  FreeTexts(exception);
  return S_OK;
}
