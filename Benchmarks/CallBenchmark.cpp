// SPDX-License-Identifier: MIT
#include "CallBenchmark.h"

#include <windows.h>
// They need windows.h before them, and this order.
#include <oaidl.h>

#include <activscp.h>

#include <cstdio>
#include <cwchar>
#include <iterator>
#include <string>

#include "Comparison.h"

namespace {

// The parser's 32-bit form; libraries do not carry its identifier.
constexpr IID kActiveScriptParse = {
    0xBB1A2AE2, 0xA4F9, 0x11CF, {0x8F, 0x20, 0x00, 0x80, 0x5F, 0x2C, 0xD0, 0x64}};

// Of the called object, in this process only.
constexpr CLSID kTargetClass = {
    0x7D4F1B1A, 0x93C6, 0x4E57, {0xA1, 0x0B, 0x5E, 0x0D, 0x2F, 0x64, 0x38, 0x9C}};
constexpr wchar_t kTargetClassText[] = L"{7D4F1B1A-93C6-4E57-A10B-5E0D2F64389C}";

constexpr char kMacro[] = {
#embed "calls.rb" suffix(, 0)
};

// The called object. It is never freed; its count is a formality.
class Target final : public IDispatch {
 public:
  // In the order of the macro's loops.
  Comparison comparisons[2] = {
      {"call with 3 arguments : win32ole", Comparison::Measure::kRatio, 1},
      {"call without arguments : win32ole", Comparison::Measure::kRatio, 1}};

  HRESULT STDMETHODCALLTYPE QueryInterface(REFIID id, void** object) override {
    const bool known = id == IID_IUnknown || id == IID_IDispatch;
    *object = known ? this : nullptr;
    return known ? S_OK : E_NOINTERFACE;
  }
  ULONG STDMETHODCALLTYPE AddRef() override { return 2; }
  ULONG STDMETHODCALLTYPE Release() override { return 1; }

  HRESULT STDMETHODCALLTYPE GetTypeInfoCount(UINT* count) override {
    *count = 0;
    return S_OK;
  }
  HRESULT STDMETHODCALLTYPE GetTypeInfo(UINT, LCID, ITypeInfo**) override { return E_NOTIMPL; }
  HRESULT STDMETHODCALLTYPE GetIDsOfNames(REFIID, LPOLESTR* names, UINT, LCID,
                                          DISPID* ids) override {
    for (DISPID id = 0; id < static_cast<DISPID>(std::size(kNames)); ++id) {
      if (std::wcscmp(names[0], kNames[id]) != 0) continue;
      ids[0] = id;
      return S_OK;
    }
    ids[0] = DISPID_UNKNOWN;
    return DISP_E_UNKNOWNNAME;
  }
  HRESULT STDMETHODCALLTYPE Invoke(DISPID id, REFIID, LCID, WORD, DISPPARAMS* parameters,
                                   VARIANT* result, EXCEPINFO*, UINT*) override {
    switch (id) {
      case kCall:
        if (result) {
          result->vt = VT_I4;
          result->lVal = 42;
        }
        return S_OK;
      case kClassId:
        if (!result) return S_OK;
        result->vt = VT_BSTR;
        result->bstrVal = SysAllocString(kTargetClassText);
        return S_OK;
      case kTake: {
        if (parameters->cArgs != 3) return DISP_E_BADPARAMCOUNT;
        const VARIANT* const last = parameters->rgvarg;
        comparisons[last[2].lVal].Add(last[1].dblVal, last[0].dblVal);
        return S_OK;
      }
      default:
        return DISP_E_MEMBERNOTFOUND;
    }
  }

 private:
  enum : DISPID { kCall, kClassId, kTake };
  static constexpr const wchar_t* kNames[] = {L"f", L"class_id", L"take"};
};

// Hands out the one object, as if it made it.
class TargetFactory final : public IClassFactory {
 public:
  explicit TargetFactory(Target& object) : target(object) {}

  HRESULT STDMETHODCALLTYPE QueryInterface(REFIID id, void** object) override {
    const bool known = id == IID_IUnknown || id == IID_IClassFactory;
    *object = known ? this : nullptr;
    return known ? S_OK : E_NOINTERFACE;
  }
  ULONG STDMETHODCALLTYPE AddRef() override { return 2; }
  ULONG STDMETHODCALLTYPE Release() override { return 1; }
  HRESULT STDMETHODCALLTYPE CreateInstance(IUnknown*, REFIID id, void** object) override {
    return target.QueryInterface(id, object);
  }
  HRESULT STDMETHODCALLTYPE LockServer(BOOL) override { return S_OK; }

 private:
  Target& target;
};

class Site final : public IActiveScriptSite {
 public:
  explicit Site(Target& object) : target(object) {}

  HRESULT STDMETHODCALLTYPE QueryInterface(REFIID id, void** object) override {
    const bool known = id == IID_IUnknown || id == IID_IActiveScriptSite;
    *object = known ? this : nullptr;
    return known ? S_OK : E_NOINTERFACE;
  }
  ULONG STDMETHODCALLTYPE AddRef() override { return 2; }
  ULONG STDMETHODCALLTYPE Release() override { return 1; }

  HRESULT STDMETHODCALLTYPE GetLCID(LCID*) override { return E_NOTIMPL; }
  HRESULT STDMETHODCALLTYPE GetItemInfo(LPCOLESTR, DWORD, IUnknown** item, ITypeInfo**) override {
    *item = &target;
    return S_OK;
  }
  HRESULT STDMETHODCALLTYPE GetDocVersionString(BSTR*) override { return E_NOTIMPL; }
  HRESULT STDMETHODCALLTYPE OnScriptTerminate(const VARIANT*, const EXCEPINFO*) override {
    return S_OK;
  }
  HRESULT STDMETHODCALLTYPE OnStateChange(SCRIPTSTATE) override { return S_OK; }
  HRESULT STDMETHODCALLTYPE OnScriptError(IActiveScriptError* error) override {
    EXCEPINFO exception = {};
    error->GetExceptionInfo(&exception);
    std::fprintf(stderr, "%ls\n", exception.bstrDescription);
    SysFreeString(exception.bstrSource);
    SysFreeString(exception.bstrDescription);
    SysFreeString(exception.bstrHelpFile);
    return S_OK;
  }
  HRESULT STDMETHODCALLTYPE OnEnterScript() override { return S_OK; }
  HRESULT STDMETHODCALLTYPE OnLeaveScript() override { return S_OK; }

 private:
  Target& target;
};

HRESULT RunMacro(Site& site) {
  CLSID classId;
  HRESULT result = CLSIDFromProgID(L"RubyScript", &classId);
  void* object = nullptr;
  if (SUCCEEDED(result))
    result =
        CoCreateInstance(classId, nullptr, CLSCTX_INPROC_SERVER, __uuidof(IActiveScript), &object);
  if (FAILED(result)) return result;
  IActiveScript* const engine = static_cast<IActiveScript*>(object);
  result = engine->QueryInterface(kActiveScriptParse, &object);
  if (SUCCEEDED(result)) {
    IActiveScriptParse* const parser = static_cast<IActiveScriptParse*>(object);
    const std::wstring text(kMacro, kMacro + std::size(kMacro) - 1);
    result = engine->SetScriptSite(&site);
    if (SUCCEEDED(result)) result = parser->InitNew();
    if (SUCCEEDED(result)) result = engine->AddNamedItem(L"tarn", SCRIPTITEM_ISVISIBLE);
    if (SUCCEEDED(result))
      result = parser->ParseScriptText(text.c_str(), nullptr, nullptr, nullptr, 0, 0, 0, nullptr,
                                       nullptr);
    if (SUCCEEDED(result)) result = engine->SetScriptState(SCRIPTSTATE_CONNECTED);
    parser->Release();
  }
  engine->Close();
  engine->Release();
  return result;
}

}  // namespace

bool CompareCalls() {
  // For the rest of the process: win32ole lets go of the object when Ruby collects it.
  static Target target;
  static TargetFactory factory(target);
  Site site(target);
  DWORD cookie = 0;
  HRESULT result = CoRegisterClassObject(kTargetClass, &factory, CLSCTX_INPROC_SERVER,
                                         REGCLS_MULTIPLEUSE, &cookie);
  if (SUCCEEDED(result)) {
    result = RunMacro(site);
    CoRevokeClassObject(cookie);
  }
  if (FAILED(result)) {
    std::fprintf(stderr, "the benchmark of calls failed: 0x%08lX\n",
                 static_cast<unsigned long>(result));
    return false;
  }
  for (const Comparison& each : target.comparisons) each.Print();
  return true;
}
