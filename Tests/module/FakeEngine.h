// SPDX-License-Identifier: MIT
// A recording Active Scripting engine: an in-process COM class under the ProgID "FakeEngine". It
// logs every call of the script site, in order and with arguments, answers what the test's plan
// says, and lets the test play the script.
#pragma once

#include <windows.h>
// clang-format off
#include <oleauto.h>
#include <activscp.h>
// clang-format on

#include <functional>
#include <map>
#include <string>
#include <vector>

class FakeEngine;

struct EnginePlan {
  std::map<std::string, HRESULT> results;      // by step as it is logged; S_OK for others
  std::function<void(FakeEngine&)> onParse;    // inside ParseScriptText
  std::function<void(FakeEngine&)> onConnect;  // the script: inside SetScriptState(CONNECTED)
  std::wstring source;                         // what ParseScriptText got
};
extern EnginePlan plan;
extern int liveEngines;

void RegisterFakeEngine();  // for this process; needs an initialised apartment
std::string Hex(HRESULT result);

class FakeEngine : public IActiveScript, public IActiveScriptParse {
 public:
  FakeEngine() { ++liveEngines; }
  virtual ~FakeEngine() { --liveEngines; }

  IActiveScriptSite* site = nullptr;
  // The `tarn` object as an engine gets it from the site.
  IDispatch* Item();
  // The script's call `tarn.name(arguments)`, with its outcome and result logged.
  void Call(const wchar_t* name, std::vector<VARIANT> arguments = {});

  STDMETHODIMP QueryInterface(REFIID riid, void** object) override;
  STDMETHODIMP_(ULONG) AddRef() override { return ++references; }
  STDMETHODIMP_(ULONG) Release() override;
  STDMETHODIMP SetScriptSite(IActiveScriptSite* newSite) override {
    site = newSite;
    return Note("SetScriptSite");
  }
  STDMETHODIMP GetScriptSite(REFIID, void**) override { return Note("GetScriptSite"); }
  STDMETHODIMP SetScriptState(SCRIPTSTATE state) override;
  STDMETHODIMP GetScriptState(SCRIPTSTATE*) override { return Note("GetScriptState"); }
  STDMETHODIMP Close() override { return Note("Close"); }
  STDMETHODIMP AddNamedItem(LPCOLESTR name, DWORD flags) override;
  STDMETHODIMP AddTypeLib(REFGUID, DWORD, DWORD, DWORD) override { return Note("AddTypeLib"); }
  STDMETHODIMP GetScriptDispatch(LPCOLESTR, IDispatch**) override { return Note("GetDispatch"); }
  STDMETHODIMP GetCurrentScriptThreadID(SCRIPTTHREADID*) override { return Note("GetThread"); }
  STDMETHODIMP GetScriptThreadID(DWORD, SCRIPTTHREADID*) override { return Note("GetThreadID"); }
  STDMETHODIMP GetScriptThreadState(SCRIPTTHREADID, SCRIPTTHREADSTATE*) override {
    return Note("GetThreadState");
  }
  STDMETHODIMP InterruptScriptThread(SCRIPTTHREADID thread, const EXCEPINFO* info,
                                     DWORD flags) override;
  STDMETHODIMP Clone(IActiveScript**) override { return Note("Clone"); }
  STDMETHODIMP InitNew() override { return Note("InitNew"); }
  STDMETHODIMP AddScriptlet(LPCOLESTR, LPCOLESTR, LPCOLESTR, LPCOLESTR, LPCOLESTR, LPCOLESTR, DWORD,
                            ULONG, DWORD, BSTR*, EXCEPINFO*) override {
    return Note("AddScriptlet");
  }
  STDMETHODIMP ParseScriptText(LPCOLESTR code, LPCOLESTR item, IUnknown* context,
                               LPCOLESTR delimiter, DWORD cookie, ULONG line, DWORD flags,
                               VARIANT* result, EXCEPINFO* info) override;

 private:
  static HRESULT Note(const std::string& step);
  ULONG references = 0;
};

VARIANT Value(VARTYPE type, LONGLONG bits = 0);
VARIANT Real(double value);
VARIANT Text(const std::wstring& value);  // freed by Call
