// SPDX-License-Identifier: MIT
#include "FakeEngine.h"

#include <algorithm>
#include <deque>
#include <filesystem>
#include <utility>

#include "RawHost.h"

static std::string Utf8(const wchar_t* text) { return std::filesystem::path(text).string(); }

static HRESULT Note(const std::string& step) {
  Log("engine: " + step);
  return results[step];
}

// Two interfaces of one object: each is the address of its table. The class object shares what all
// interfaces begin with.
struct FakeEngine {
  void** script;
  void** parser;
  IActiveScriptSite* site;
};

namespace {
HRESULT __stdcall QueryInterface(FakeEngine* engine, REFIID riid, void** object) {
  const bool parser = riid == __uuidof(IActiveScriptParse);
  const HRESULT result = Note(parser ? "QueryInterface of the parser" : "QueryInterface");
  *object = FAILED(result) ? nullptr : parser ? &engine->parser : &engine->script;
  engineReferences += SUCCEEDED(result);
  return result;
}
ULONG __stdcall AddRef(void*) { return ++engineReferences; }
ULONG __stdcall Release(void*) { return --engineReferences; }
HRESULT __stdcall SetScriptSite(FakeEngine* engine, IActiveScriptSite* newSite) {
  engine->site = newSite;
  return Note("SetScriptSite");
}
HRESULT __stdcall SetScriptState(FakeEngine* engine, SCRIPTSTATE state) {
  IActiveScriptSite* const outer = std::exchange(site, engine->site);
  const HRESULT result = Note("SetScriptState " + std::to_string(state));
  site = outer;
  return result;
}
HRESULT __stdcall AddNamedItem(void*, LPCOLESTR name, DWORD flags) {
  return Note("AddNamedItem " + Utf8(name) + " " + std::to_string(flags));
}
HRESULT __stdcall InterruptScriptThread(void*, int thread, const void* info, DWORD flags) {
  return Note("InterruptScriptThread " + std::to_string(thread) + (info ? " with info " : " ") +
              std::to_string(flags));
}
HRESULT __stdcall InitNew(void*) { return Note("InitNew"); }
HRESULT __stdcall ParseScriptText(void*, LPCOLESTR code, int item, int context, int delimiter,
                                  int cookie, int line, int flags, int result, EXCEPINFO* info) {
  source = code;
  const bool plain = !(item | context | delimiter | cookie | line | flags | result);
  const HRESULT outcome =
      Note(plain && !info->bstrDescription ? "ParseScriptText" : "ParseScriptText, not plain");
  for (BSTR* text : {&info->bstrSource, &info->bstrDescription, &info->bstrHelpFile})
    if (FAILED(outcome)) *text = SysAllocString(L"text");
  return outcome;
}
}  // namespace

HRESULT __stdcall CreateFakeEngine(void*, IUnknown*, REFIID riid, void** object) {
  static auto script =
      Table(QueryInterface, AddRef, Release, SetScriptSite, Unused, SetScriptState, Unused, Unused,
            AddNamedItem, Unused, Unused, Unused, Unused, Unused, InterruptScriptThread, Unused);
  static auto parser = Table(QueryInterface, AddRef, Release, InitNew, Unused, ParseScriptText);
  static std::deque<FakeEngine> engines;  // kept: a run that was stopped has forgotten its own
  if (engines.size() > 1000) engines.pop_front();  // is long over
  engines.push_back({script.data(), parser.data(), nullptr});
  return QueryInterface(&engines.back(), riid, object);
}
void RegisterFakeEngine() {
  static auto table = Table(QueryInterface, AddRef, Release, CreateFakeEngine, Unused);
  static void** factory = table.data();
  CLSID classId;
  DWORD cookie;
  CLSIDFromProgID(L"JScript", &classId);
  CoRegisterClassObject(classId, reinterpret_cast<IUnknown*>(&factory), CLSCTX_INPROC_SERVER,
                        REGCLS_MULTIPLEUSE, &cookie);
}

IDispatch* Item() {
  IUnknown* item = nullptr;
  site->GetItemInfo(L"tarn", SCRIPTINFO_IUNKNOWN, &item, nullptr);
  return static_cast<IDispatch*>(item);
}

HRESULT Call(const wchar_t* name, std::vector<VARIANT> arguments) {
  IDispatch* item = Item();
  LPOLESTR names[] = {const_cast<LPOLESTR>(name)};
  std::reverse(arguments.begin(), arguments.end());
  DISPPARAMS params = {arguments.data(), nullptr, static_cast<UINT>(arguments.size()), 0};
  DISPID id = -1;
  VARIANT result = Value(VT_R8, 0.0);
  HRESULT outcome = item->GetIDsOfNames(IID_NULL, names, 1, LOCALE_USER_DEFAULT, &id);
  if (outcome == S_OK)
    outcome = item->Invoke(id, IID_NULL, LOCALE_USER_DEFAULT, DISPATCH_METHOD, &params, &result,
                           nullptr, nullptr);
  const bool text = result.vt == VT_BSTR;
  Log("returned " + Hex(outcome) + ", type " + std::to_string(result.vt) + ", " +
      std::to_string(text ? static_cast<int>(SysStringLen(result.bstrVal)) : result.lVal) + " " +
      Utf8(text && result.bstrVal ? result.bstrVal : L""));
  for (VARIANT& argument : arguments) VariantClear(&argument);
  VariantClear(&result), item->Release();
  return outcome;
}
