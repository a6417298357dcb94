// SPDX-License-Identifier: MIT
#include "FakeEngine.h"

#include <cstring>

EnginePlan plan;

static const CLSID kClassId = {
    0x5d7a1c30, 0x6e0b, 0x4e58, {0x9a, 0x41, 0x3b, 0x7c, 0x11, 0x52, 0xd0, 0x6f}};
static const wchar_t kClassText[] = L"{5D7A1C30-6E0B-4E58-9A41-3B7C1152D06F}";
static const wchar_t kProgIdKey[] = L"FakeEngine";

namespace {
class Factory : public IClassFactory {
 public:
  STDMETHODIMP QueryInterface(REFIID, void** object) override {
    *object = this;
    return S_OK;
  }
  STDMETHODIMP_(ULONG) AddRef() override { return 2; }
  STDMETHODIMP_(ULONG) Release() override { return 1; }
  STDMETHODIMP LockServer(BOOL) override { return S_OK; }
  STDMETHODIMP CreateInstance(IUnknown*, REFIID riid, void** object) override {
    *object = nullptr;
    if (FAILED(plan.results["CreateInstance"])) return plan.results["CreateInstance"];
    FakeEngine* engine = new FakeEngine;
    engine->AddRef();
    const HRESULT result = engine->QueryInterface(riid, object);
    engine->Release();
    return result;
  }
};
Factory factory;
}  // namespace

FakeEngineClass::FakeEngineClass() {
  HKEY key;
  RegCreateKeyW(HKEY_CLASSES_ROOT, (std::wstring(kProgIdKey) + L"\\CLSID").c_str(), &key);
  RegSetValueExW(key, nullptr, 0, REG_SZ, reinterpret_cast<const BYTE*>(kClassText),
                 sizeof kClassText);
  RegCloseKey(key);
  CoRegisterClassObject(kClassId, &factory, CLSCTX_INPROC_SERVER, REGCLS_MULTIPLEUSE, &cookie);
}

FakeEngineClass::~FakeEngineClass() {
  CoRevokeClassObject(cookie);
  RegDeleteTreeW(HKEY_CLASSES_ROOT, kProgIdKey);
}

FakeEngine::FakeEngine() { ++plan.liveEngines; }

FakeEngine::~FakeEngine() {
  if (site) site->Release();
  --plan.liveEngines;
}

HRESULT FakeEngine::Note(const std::string& step) {
  plan.log.push_back(step);
  const auto planned = plan.results.find(step);
  return planned == plan.results.end() ? S_OK : planned->second;
}

HRESULT FakeEngine::QueryInterface(REFIID riid, void** object) {
  *object = nullptr;
  if (riid == __uuidof(IActiveScriptParse)) {
    const HRESULT result = Note("QueryParse");
    if (FAILED(result)) return result;
    *object = static_cast<IActiveScriptParse*>(this);
  } else if (riid == IID_IUnknown || riid == IID_IActiveScript) {
    *object = static_cast<IActiveScript*>(this);
  } else {
    return E_NOINTERFACE;
  }
  AddRef();
  return S_OK;
}

ULONG FakeEngine::Release() {
  const ULONG left = --references;
  if (left == 0) delete this;
  return left;
}

HRESULT FakeEngine::SetScriptSite(IActiveScriptSite* newSite) {
  site = newSite;
  site->AddRef();
  return Note("SetScriptSite");
}

HRESULT FakeEngine::SetScriptState(SCRIPTSTATE state) {
  const HRESULT result = Note("SetScriptState " + std::to_string(state));
  if (state == SCRIPTSTATE_CONNECTED && plan.onConnect) plan.onConnect(*this);
  return result;
}

HRESULT FakeEngine::AddNamedItem(LPCOLESTR name, DWORD flags) {
  const std::wstring wide(name);
  return Note("AddNamedItem " + std::string(wide.begin(), wide.end()) + " " +
              std::to_string(flags));
}

HRESULT FakeEngine::InterruptScriptThread(SCRIPTTHREADID thread, const EXCEPINFO* info,
                                          DWORD flags) {
  return Note("Interrupt " + std::to_string(static_cast<int>(thread)) + (info ? " info " : " ") +
              std::to_string(flags));
}

HRESULT FakeEngine::ParseScriptText(LPCOLESTR code, LPCOLESTR item, IUnknown* context,
                                    LPCOLESTR delimiter, DWORD cookie, ULONG line, DWORD flags,
                                    VARIANT* result, EXCEPINFO* info) {
  plan.source = code;
  const bool plain = !item && !context && !delimiter && !cookie && !line && !flags && !result &&
                     info && !info->bstrDescription;
  if (plan.onParse) plan.onParse(*this);
  return Note(plain ? "ParseScriptText" : "ParseScriptText with surprising arguments");
}

IDispatch* FakeEngine::Item() {
  IUnknown* item = nullptr;
  if (site->GetItemInfo(L"tarn", SCRIPTINFO_IUNKNOWN, &item, nullptr) != S_OK) return nullptr;
  return static_cast<IDispatch*>(item);
}

HRESULT FakeEngine::Call(const wchar_t* name, std::vector<VARIANT> arguments, VARIANT* result) {
  IDispatch* item = Item();
  DISPID id = -1;
  LPOLESTR names[] = {const_cast<LPOLESTR>(name)};
  HRESULT outcome = item->GetIDsOfNames(IID_NULL, names, 1, LOCALE_USER_DEFAULT, &id);
  if (outcome == S_OK) {
    std::vector<VARIANT> reversed(arguments.rbegin(), arguments.rend());
    DISPPARAMS params = {reversed.data(), nullptr, static_cast<UINT>(reversed.size()), 0};
    outcome = item->Invoke(id, IID_NULL, LOCALE_USER_DEFAULT, DISPATCH_METHOD, &params, result,
                           nullptr, nullptr);
  }
  for (VARIANT& argument : arguments) VariantClear(&argument);
  item->Release();
  return outcome;
}

VARIANT Plain(VARTYPE type, LONGLONG bits) {
  VARIANT value = {};
  value.vt = type;
  value.llVal = bits;
  return value;
}

VARIANT Integer(long value) { return Plain(VT_I4, value); }

VARIANT Real(double value) {
  LONGLONG bits;
  std::memcpy(&bits, &value, sizeof bits);
  return Plain(VT_R8, bits);
}

VARIANT Text(const wchar_t* value) {
  VARIANT text = Plain(VT_BSTR);
  text.bstrVal = value ? SysAllocString(value) : nullptr;
  return text;
}
