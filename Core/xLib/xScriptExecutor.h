// SPDX-License-Identifier: MIT
// The script site: creates one Active Scripting engine from a ProgID, publishes `tarn` to it,
// parses and runs one macro file, lets the host stop it, and turns every engine failure and script
// error into one text for the host.
//
// Ownership: owns the engine, its parser and the dispatch object; owned by the run that made it.
// The COM reference counting is a formality: AddRef and Release always answer 1.
// Errors: reported to the host as text; a site that is not ready executes nothing.
// Threading: the macro run's thread, which the constructor initialises for COM. Interrupt() is made
// while Execute() is inside the engine.
//
// Next on the reader's path: xScript, the dispatch object.
#pragma once

// activscp.h must come after its base interfaces.
#include <oaidl.h>
// clang-format off
#include <activscp.h>
// clang-format on

#include "cLib/cHost.h"
#include "cLib/cSlots.h"
#include "cLib/cString.h"
#include "xLib/xScript.h"

class xScriptExecutor : public IActiveScriptSite, public IActiveScriptSiteWindow {
 public:
  // Creates the engine named `progId`. The flags go to the dispatch object, the site flag into the
  // host's context record. A host must be current. See IsReady for the outcome.
  xScriptExecutor(const char* progId, bool fixCRLF, bool fixDelimiter, u8 siteFlag);
  xScriptExecutor(const xScriptExecutor&) = delete;
  xScriptExecutor& operator=(const xScriptExecutor&) = delete;

  STDMETHODIMP QueryInterface(REFIID riid, void** object) override;
  STDMETHODIMP_(ULONG) AddRef() override { return 1; }
  STDMETHODIMP_(ULONG) Release() override { return 1; }

  STDMETHODIMP GetLCID(LCID*) override { return E_NOTIMPL; }  // the engine takes the user's
  STDMETHODIMP GetItemInfo(LPCOLESTR name, DWORD mask, IUnknown** item, ITypeInfo** type) override;
  STDMETHODIMP GetDocVersionString(BSTR*) override { return E_NOTIMPL; }
  STDMETHODIMP OnScriptTerminate(const VARIANT*, const EXCEPINFO*) override { return E_NOTIMPL; }
  STDMETHODIMP OnStateChange(SCRIPTSTATE) override { return E_NOTIMPL; }
  STDMETHODIMP OnScriptError(IActiveScriptError* error) override;
  STDMETHODIMP OnEnterScript() override { return E_NOTIMPL; }
  STDMETHODIMP OnLeaveScript() override { return E_NOTIMPL; }
  SLOTS_FROM(11);
  SLOT(11) ~xScriptExecutor();

  STDMETHODIMP GetWindow(HWND* window) override;
  STDMETHODIMP EnableModeless(BOOL) override { return S_OK; }

  bool IsReady() const { return ready; }
  // Parses and runs the file; true only when both succeeded.
  bool Execute(const char* file);
  // Interrupts all script threads.
  void Interrupt();
  // Whether the engine is connected.
  bool IsRunning();

 private:
  static void CheckLayout();
  HRESULT CreateEngine(const char* progId);
  void ReportCreation(HRESULT result, const char* progId);
  bool Parse(const char* file);
  void SendReport(HRESULT result, const char* format, const char* name, const char* extra);

  bool ready = false;  // the whole creation chain succeeded
  String fileName;     // of the macro, for error reports
  xScript dispatch;
  HostInterface* host;
  IActiveScript* engine = nullptr;
  IActiveScriptParse* parser = nullptr;
};
