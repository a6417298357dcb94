// SPDX-License-Identifier: MIT
// The script site of an engine that only parses a macro. It keeps the first error.
//
// Ownership: the caller owns it and closes the engine first; references are not counted.
// Errors: HRESULTs. Threading: the engine's thread.
#pragma once

#include <activscp.h>
#include <windows.h>

#include <optional>
#include <string>

#include "report/Diagnostic.h"

class ParseSite final : public IActiveScriptSite {
 public:
  explicit ParseSite(std::string macroName) : macro(std::move(macroName)) {}

  std::optional<Diagnostic> TakeError() { return std::move(error); }

  STDMETHODIMP QueryInterface(REFIID riid, void** object) override;
  STDMETHODIMP_(ULONG) AddRef() override { return 1; }
  STDMETHODIMP_(ULONG) Release() override { return 1; }
  STDMETHODIMP GetLCID(LCID*) override { return E_NOTIMPL; }
  STDMETHODIMP GetItemInfo(LPCOLESTR, DWORD, IUnknown**, ITypeInfo**) override {
    return TYPE_E_ELEMENTNOTFOUND;
  }
  STDMETHODIMP GetDocVersionString(BSTR*) override { return E_NOTIMPL; }
  STDMETHODIMP OnScriptTerminate(const VARIANT*, const EXCEPINFO*) override { return S_OK; }
  STDMETHODIMP OnStateChange(SCRIPTSTATE) override { return S_OK; }
  STDMETHODIMP OnScriptError(IActiveScriptError* scriptError) override;
  STDMETHODIMP OnEnterScript() override { return S_OK; }
  STDMETHODIMP OnLeaveScript() override { return S_OK; }

 private:
  const std::string macro;
  std::optional<Diagnostic> error;
};
