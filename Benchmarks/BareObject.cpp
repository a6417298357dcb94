// SPDX-License-Identifier: MIT
#include "BareObject.h"

#include <cstdio>
#include <iterator>
#include <utility>

namespace {

// The parser's 32-bit form; libraries do not carry its identifier.
constexpr IID kActiveScriptParse = {
    0xBB1A2AE2, 0xA4F9, 0x11CF, {0x8F, 0x20, 0x00, 0x80, 0x5F, 0x2C, 0xD0, 0x64}};

constexpr std::pair<const char*, Function> kFunctions[] = {
    {"f", kF},       {"text", kText},   {"class_id", kClassId},
    {"take", kTake}, {"start", kStart}, {"finish", kFinish},
};

// Hands out the one object, as if it made it.
class Factory final : public Resident<IClassFactory> {
 public:
  explicit Factory(BareObject& shared) : object(shared) {}

  HRESULT STDMETHODCALLTYPE CreateInstance(IUnknown*, REFIID id, void** result) override {
    return object.QueryInterface(id, result);
  }
  HRESULT STDMETHODCALLTYPE LockServer(BOOL) override { return S_OK; }

 private:
  BareObject& object;
};

class Site final : public Resident<IActiveScriptSite> {
 public:
  explicit Site(IDispatch& tarn) : item(tarn) {}

  HRESULT STDMETHODCALLTYPE GetLCID(LCID*) override { return E_NOTIMPL; }
  HRESULT STDMETHODCALLTYPE GetItemInfo(LPCOLESTR, DWORD, IUnknown** object, ITypeInfo**) override {
    item.AddRef();
    *object = &item;
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
  IDispatch& item;
};

HRESULT RunText(IActiveScript& engine, IActiveScriptParse& parser, Site& site,
                const wchar_t* text) {
  HRESULT result = engine.SetScriptSite(&site);
  if (SUCCEEDED(result)) result = parser.InitNew();
  if (SUCCEEDED(result)) result = engine.AddNamedItem(L"tarn", SCRIPTITEM_ISVISIBLE);
  if (SUCCEEDED(result))
    result = parser.ParseScriptText(text, nullptr, nullptr, nullptr, 0, 0, 0, nullptr, nullptr);
  if (SUCCEEDED(result)) result = engine.SetScriptState(SCRIPTSTATE_CONNECTED);
  return result;
}

}  // namespace

Function FunctionNamed(const std::string& name) {
  for (const auto& [known, function] : kFunctions)
    if (name == known) return function;
  return kUnknown;
}

Function FunctionNamed(const std::wstring& name) {
  return FunctionNamed(std::string(name.begin(), name.end()));
}

HRESULT BareObject::GetTypeInfoCount(UINT* count) {
  *count = 0;
  return S_OK;
}

HRESULT BareObject::GetIDsOfNames(REFIID, LPOLESTR* names, UINT, LCID, DISPID* ids) {
  // The one that is called over and over costs what a comparison of its name costs.
  const bool isF = names[0][0] == L'f' && names[0][1] == 0;
  ids[0] = isF ? kF : FunctionNamed(std::wstring(names[0]));
  return ids[0] == kUnknown ? DISP_E_UNKNOWNNAME : S_OK;
}

HRESULT BareObject::Invoke(DISPID id, REFIID, LCID, WORD, DISPPARAMS* parameters, VARIANT* result,
                           EXCEPINFO*, UINT*) {
  if (result) {
    result->vt = VT_I4;
    result->lVal = 42;
  }
  switch (id) {
    case kF:
      return S_OK;
    case kStart:
      clock.Start();
      return S_OK;
    case kFinish:
      clock.Finish();
      return S_OK;
    case kText:
      if (!result) return S_OK;
      result->vt = VT_BSTR;
      result->bstrVal = SysAllocString(L"text");
      return S_OK;
    case kClassId: {
      if (!result) return S_OK;
      wchar_t text[39];
      StringFromGUID2(kClass, text, 39);
      result->vt = VT_BSTR;
      result->bstrVal = SysAllocString(text);
      return S_OK;
    }
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

HRESULT RegisterBareObject(BareObject& object) {
  static Factory factory(object);
  static DWORD cookie = 0;
  return cookie ? S_OK
                : CoRegisterClassObject(BareObject::kClass, &factory, CLSCTX_INPROC_SERVER,
                                        REGCLS_MULTIPLEUSE, &cookie);
}

HRESULT RunBare(const wchar_t* progId, IDispatch& item, const wchar_t* text) {
  CLSID classId;
  HRESULT result = CLSIDFromProgID(progId, &classId);
  void* object = nullptr;
  if (SUCCEEDED(result))
    result =
        CoCreateInstance(classId, nullptr, CLSCTX_INPROC_SERVER, __uuidof(IActiveScript), &object);
  if (FAILED(result)) return result;
  IActiveScript* const engine = static_cast<IActiveScript*>(object);
  Site site(item);
  result = engine->QueryInterface(kActiveScriptParse, &object);
  if (SUCCEEDED(result)) {
    IActiveScriptParse* const parser = static_cast<IActiveScriptParse*>(object);
    result = RunText(*engine, *parser, site, text);
    parser->Release();
  }
  engine->SetScriptState(SCRIPTSTATE_CLOSED);
  engine->Release();
  return result;
}
