// SPDX-License-Identifier: MIT
// An Active Scripting host as the Ruby engine meets it, written from the interfaces alone: it shares
// no header with the engine, so an identifier or a contract that drifts fails here. Everything that
// the engine does to the host is logged, in order.
#pragma once

#include <gtest/gtest.h>
#include <windows.h>
// clang-format off
#include <oleauto.h>
#include <activscp.h>
#include <objsafe.h>
// clang-format on

#include <functional>
#include <map>
#include <string>
#include <vector>

#include "../support/Values.h"

using namespace std::string_literals;

inline constexpr CLSID kEngineClass = {
    0x5C0B6E2C, 0x4F0D, 0x4B6B, {0x9E, 0x0F, 0x7B, 0x1C, 0x3A, 0x9D, 0x52, 0xE4}};
inline constexpr IID kParseId = {
    0xBB1A2AE2, 0xA4F9, 0x11CF, {0x8F, 0x20, 0x00, 0x80, 0x5F, 0x2C, 0xD0, 0x64}};

inline constexpr HRESULT kReported = 0x80020101;  // the error has been reported to the site

// What was logged since the last time, joined by "; ".
void Log(const std::string& line);
std::string TakeLog();

// Runs each macro of a file in `transcripts` and compares the outcome with the line "> " below it.
// With SCRIPTRUBY_PROMOTE=1 the file is rewritten instead.
void CheckTranscript(const std::string& file,
                     const std::function<std::string(const std::string& macro)>& run);

// An entry point of the engine's DLL, which is loaded on first use and stays.
void* EngineExport(const char* name);
inline HRESULT WINAPI GetClassObject(REFCLSID id, REFIID riid, void** object) {
  return reinterpret_cast<decltype(&DllGetClassObject)>(EngineExport("DllGetClassObject"))(id, riid,
                                                                                           object);
}

// Type and value, such as "I4 1" or "'text'"; units beyond ASCII as \xE4 or \u20AC, and 20 equal ones
// or more as x{20}.
std::string Show(const VARIANT& value);
std::wstring Wide(const std::string& utf8);

inline VARIANT Text(const std::wstring& text) {
  return Value(VT_BSTR, SysAllocStringLen(text.data(), static_cast<UINT>(text.size())));
}

// An object with the functions that a test gives it. Calls are logged as "name.f(I4 1)", those of
// the default property as "name.[](I4 1)", settings with "=" after the name, and each query for an
// unknown name as "name.f?".
class Item final : public IDispatch {
 public:
  struct Call {
    DISPPARAMS* arguments;
    VARIANT* result;
    EXCEPINFO* exception;
  };
  using Function = std::function<HRESULT(Call)>;

  explicit Item(std::string itemName) : name(std::move(itemName)) {}
  // Instead of the one that has the name, if any.
  void Add(
      const std::string& function, Function body = [](Call) { return S_OK; });
  // A function that only does something; it may leave by a jump or a fault.
  void Does(const std::string& function, std::function<void()> body) {
    Add(function, [body](Call) { return body(), S_OK; });
  }

  STDMETHODIMP QueryInterface(REFIID riid, void** object) override;
  STDMETHODIMP_(ULONG) AddRef() override { return ++references; }
  STDMETHODIMP_(ULONG) Release() override { return --references; }
  STDMETHODIMP GetTypeInfoCount(UINT*) override { return E_NOTIMPL; }
  STDMETHODIMP GetTypeInfo(UINT, LCID, ITypeInfo** info) override {
    if (!type) return E_NOTIMPL;
    return *info = type, type->AddRef(), S_OK;
  }
  STDMETHODIMP GetIDsOfNames(REFIID riid, LPOLESTR* names, UINT count, LCID, DISPID* ids) override;
  STDMETHODIMP Invoke(DISPID id, REFIID riid, LCID, WORD flags, DISPPARAMS* parameters,
                      VARIANT* result, EXCEPINFO* exception, UINT*) override;

  // Other interfaces and a type; AddRef is the caller's.
  std::function<void*(REFIID)> extension;
  ITypeInfo* type = nullptr;
  ULONG references = 1;
  bool quiet = false;        // calls are not logged
  bool byReference = false;  // arguments may be references

 private:
  const std::string name;
  std::vector<std::pair<std::string, Function>> functions;  // numbered from 1
};

// A site with one item and one engine at a time. Named "tarn", the item makes it the 8-bit host.
class Host final : public IActiveScriptSite {
 public:
  explicit Host(std::string name = "item") : itemName(std::move(name)), item(itemName) {}
  ~Host() { EXPECT_EQ(nullptr, script); }

  // Makes an engine, of this copy of the library; initialised and with the item.
  void Create(decltype(&DllGetClassObject) getClassObject = GetClassObject);
  void Open();
  // Text is UTF-8; the 8-bit host widens its bytes.
  HRESULT Parse(const std::string& text, DWORD flags = 0, VARIANT* result = nullptr,
                EXCEPINFO* exception = nullptr, DWORD cookie = 0, ULONG firstLine = 0);
  HRESULT Start() { return script->SetScriptState(SCRIPTSTATE_CONNECTED); }
  // Ends the engine; logs the references that it has left over.
  void Close();
  // Runs a macro from start to end and returns TakeLog(). Logs a failure that the site does not know.
  std::string Run(const std::string& macro);
  // The value of an expression as Ruby's `inspect` shows it, or the error.
  std::string Inspect(const std::string& expression);

  STDMETHODIMP QueryInterface(REFIID riid, void** object) override;
  STDMETHODIMP_(ULONG) AddRef() override { return ++references; }
  STDMETHODIMP_(ULONG) Release() override { return --references; }
  STDMETHODIMP GetLCID(LCID*) override { return E_NOTIMPL; }
  STDMETHODIMP GetItemInfo(LPCOLESTR name, DWORD mask, IUnknown** object, ITypeInfo**) override;
  STDMETHODIMP GetDocVersionString(BSTR*) override { return E_NOTIMPL; }
  STDMETHODIMP OnScriptTerminate(const VARIANT*, const EXCEPINFO*) override { return S_OK; }
  STDMETHODIMP OnStateChange(SCRIPTSTATE state) override;
  STDMETHODIMP OnScriptError(IActiveScriptError* error) override;
  STDMETHODIMP OnEnterScript() override;
  STDMETHODIMP OnLeaveScript() override;

  const std::string itemName;
  Item item;
  IActiveScript* script = nullptr;
  IActiveScriptParse* parse = nullptr;
  ULONG references = 1;
  bool verbose = false;        // states and enter/leave are logged
  HRESULT errorAnswer = S_OK;  // of OnScriptError, which logs an error's first line
  // The latest error, with line and column from 0.
  struct {
    std::string text, lineText;
    ULONG line;
    LONG column;
    DWORD cookie;
    HRESULT code;
    WORD wCode;
    std::string help;  // file and context
  } error = {};
};

// The code of the structured exception that ended the body; 0 without one.
unsigned long Guarded(const std::function<void()>& body);
