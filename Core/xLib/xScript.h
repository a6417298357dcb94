// SPDX-License-Identifier: MIT
// The object that scripts see as `tarn`: an IDispatch that forwards everything to the host. Names
// are looked up in the host's table of macro functions. The host executes each call; arguments and
// result are in the context record.
//
// Ownership: the script site holds it by value, so the reference count never ends its life.
// Errors: COM results, E_OUTOFMEMORY (without a call) among them; what the host meets while it runs
// a function is not an error here. Threading: the macro run's thread; only the reference count is
// atomic.
//
// Next on the reader's path: back in the host (Tools/macrorun/host/HostLink.h).
#pragma once

#include <oaidl.h>

#include "cLib/cHost.h"
#include "cLib/cSlots.h"

class xScript : public IDispatch {
 public:
  xScript(bool fixCRLF, bool fixDelimiter);
  xScript(const xScript&) = delete;
  xScript& operator=(const xScript&) = delete;

  // Also answers IID_IErrorInfo, with the IDispatch pointer: deliberate, engines only ask whether.
  STDMETHODIMP QueryInterface(REFIID riid, void** object) override;
  STDMETHODIMP_(ULONG) AddRef() override;
  STDMETHODIMP_(ULONG) Release() override;
  // Both trace that they succeeded and return E_NOTIMPL, writing nothing: deliberate, there is no
  // type information and the trace only shows that an engine asked.
  STDMETHODIMP GetTypeInfoCount(UINT* count) override;
  STDMETHODIMP GetTypeInfo(UINT index, LCID locale, ITypeInfo** info) override;
  // The host's function numbers, unchanged. E_FAIL, after a report, for a name the host does not
  // know; numbers of earlier names stay written.
  STDMETHODIMP GetIDsOfNames(REFIID riid, LPOLESTR* names, UINT count, LCID locale,
                             DISPID* ids) override;
  // Calls, property gets and puts are all the same call. Named arguments, `exception` and
  // `wrongArgument` are not used.
  STDMETHODIMP Invoke(DISPID id, REFIID riid, LCID locale, WORD flags, DISPPARAMS* params,
                      VARIANT* result, EXCEPINFO* exception, UINT* wrongArgument) override;

  SLOTS_FROM(7);
  SLOT(7) HRESULT STDMETHODCALLTYPE SupportsErrorInfo(REFIID riid);
  SLOT(8) ~xScript();
  // Sets a thread error object with a made-up error and returns E_FAIL: lets a host test how an
  // engine shows one.
  SLOT(9) HRESULT STDMETHODCALLTYPE FxFakeError();

 private:
  static void CheckLayout();

  LONG references = 0;
  HostInterface* host;
  bool fixCRLF;
  bool fixDelimiter;
};
