// SPDX-License-Identifier: MIT
// What a call of `tarn` is compared with: a COM object that converts nothing, and the steps by which
// a host runs a script with it. Nothing here is freed; reference counts are a formality.
#pragma once

#include <windows.h>
// They need windows.h before them, and this order.
#include <oaidl.h>

#include <activscp.h>

#include <string>

#include "Comparison.h"

// The functions that both the bare object and the quiet host have: start and finish set the clock of
// a script's loop, take(index, seconds, peer's seconds) receives what a script has measured itself.
enum Function : DISPID { kF = 7, kText, kClassId, kTake, kStart, kFinish, kUnknown = 2000 };
Function FunctionNamed(const std::wstring& name);
Function FunctionNamed(const std::string& name);

// Of a loop between start and finish; negative before the first.
class LoopClock {
 public:
  void Start() { started = Now(); }
  void Finish() { seconds = Now() - started; }
  double Seconds() const { return seconds; }

 private:
  double started = 0;
  double seconds = -1;
};

// A COM object that lives in a frame or for good, whatever its references say.
template <class Interface>
class Resident : public Interface {
 public:
  HRESULT STDMETHODCALLTYPE QueryInterface(REFIID id, void** object) override {
    const bool known = id == IID_IUnknown || id == __uuidof(Interface);
    *object = known ? this : nullptr;
    return known ? S_OK : E_NOINTERFACE;
  }
  ULONG STDMETHODCALLTYPE AddRef() override { return 2; }
  ULONG STDMETHODCALLTYPE Release() override { return 1; }
};

class BareObject final : public Resident<IDispatch> {
 public:
  // Of win32ole's object, in this process only.
  static constexpr CLSID kClass = {
      0x7D4F1B1A, 0x93C6, 0x4E57, {0xA1, 0x0B, 0x5E, 0x0D, 0x2F, 0x64, 0x38, 0x9C}};
  static constexpr char kClassText[] = "{7D4F1B1A-93C6-4E57-A10B-5E0D2F64389C}";

  LoopClock clock;
  Comparison* comparisons = nullptr;  // take's, by its index

  HRESULT STDMETHODCALLTYPE GetTypeInfoCount(UINT* count) override;
  HRESULT STDMETHODCALLTYPE GetTypeInfo(UINT, LCID, ITypeInfo**) override { return E_NOTIMPL; }
  HRESULT STDMETHODCALLTYPE GetIDsOfNames(REFIID, LPOLESTR* names, UINT, LCID,
                                          DISPID* ids) override;
  HRESULT STDMETHODCALLTYPE Invoke(DISPID id, REFIID, LCID, WORD, DISPPARAMS* parameters,
                                   VARIANT* result, EXCEPINFO*, UINT*) override;
};

// Lets COM make the object, for the process's one bare object: the first call decides which it is.
HRESULT RegisterBareObject(BareObject& object);

// Makes the engine, gives it `item` as `tarn`, has it parse and run the text and closes it: what the
// module does for a macro. Errors in the script go to standard error.
HRESULT RunBare(const wchar_t* progId, IDispatch& item, const wchar_t* text);
