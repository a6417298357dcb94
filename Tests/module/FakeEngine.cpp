// SPDX-License-Identifier: MIT
#include "FakeEngine.h"

#include <cstring>

#include "RawHost.h"

EnginePlan plan;
int liveEngines = 0;

static const CLSID kClassId = {
    0x5d7a1c30, 0x6e0b, 0x4e58, {0x9a, 0x41, 0x3b, 0x7c, 0x11, 0x52, 0xd0, 0x6f}};

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
    return (new FakeEngine)->QueryInterface(riid, object);
  }
};
}  // namespace

// The key is volatile: it goes with the session, and other processes may be using it until then.
void RegisterFakeEngine() {
  static Factory factory;
  static const wchar_t kText[] = L"{5D7A1C30-6E0B-4E58-9A41-3B7C1152D06F}";
  HKEY key;
  RegCreateKeyExW(HKEY_CLASSES_ROOT, L"FakeEngine\\CLSID", 0, nullptr, REG_OPTION_VOLATILE,
                  KEY_WRITE, nullptr, &key, nullptr);
  RegSetValueExW(key, nullptr, 0, REG_SZ, reinterpret_cast<const BYTE*>(kText), sizeof kText);
  RegCloseKey(key);
  DWORD cookie;
  CoRegisterClassObject(kClassId, &factory, CLSCTX_INPROC_SERVER, REGCLS_MULTIPLEUSE, &cookie);
}

std::string Hex(HRESULT result) {
  char text[16];
  std::snprintf(text, sizeof text, "%08lX", static_cast<unsigned long>(result));
  return text;
}

HRESULT FakeEngine::Note(const std::string& step) {
  Log("engine: " + step);
  const auto planned = plan.results.find(step);
  return planned == plan.results.end() ? S_OK : planned->second;
}

HRESULT FakeEngine::QueryInterface(REFIID riid, void** object) {
  *object = nullptr;
  if (riid == __uuidof(IActiveScriptParse)) {
    const HRESULT result = Note("QueryInterface of the parser");
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
  return Note("InterruptScriptThread " + std::to_string(static_cast<int>(thread)) +
              (info ? " with info " : " ") + std::to_string(flags));
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
  site->GetItemInfo(L"tarn", SCRIPTINFO_IUNKNOWN, &item, nullptr);
  return static_cast<IDispatch*>(item);
}

static std::string Describe(const VARIANT& value) {
  if (value.vt == VT_I4) return std::to_string(value.lVal);
  if (value.vt != VT_BSTR) return "type " + std::to_string(value.vt);
  std::string text = std::to_string(SysStringLen(value.bstrVal)) + " \"";
  for (const wchar_t* unit = value.bstrVal; *unit; ++unit)
    text +=
        *unit < 128 ? std::string(1, static_cast<char>(*unit)) : "<" + Hex(*unit).substr(4) + ">";
  return text + "\"";
}

void FakeEngine::Call(const wchar_t* name, std::vector<VARIANT> arguments) {
  IDispatch* item = Item();
  DISPID id = -1;
  LPOLESTR names[] = {const_cast<LPOLESTR>(name)};
  VARIANT result = Value(VT_R8);
  HRESULT outcome = item->GetIDsOfNames(IID_NULL, names, 1, LOCALE_USER_DEFAULT, &id);
  if (outcome == S_OK) {
    std::vector<VARIANT> reversed(arguments.rbegin(), arguments.rend());
    DISPPARAMS params = {reversed.data(), nullptr, static_cast<UINT>(reversed.size()), 0};
    outcome = item->Invoke(id, IID_NULL, LOCALE_USER_DEFAULT, DISPATCH_METHOD, &params, &result,
                           nullptr, nullptr);
  }
  Log("returned " + Hex(outcome) + ", " + Describe(result));
  VariantClear(&result);
  for (VARIANT& argument : arguments) VariantClear(&argument);
  item->Release();
}

VARIANT Value(VARTYPE type, LONGLONG bits) {
  VARIANT value = {};
  value.vt = type;
  value.llVal = bits;
  return value;
}

VARIANT Real(double value) {
  LONGLONG bits;
  std::memcpy(&bits, &value, sizeof bits);
  return Value(VT_R8, bits);
}

VARIANT Text(const std::wstring& value) {
  return Value(VT_BSTR, reinterpret_cast<LONG_PTR>(SysAllocString(value.c_str())));
}
