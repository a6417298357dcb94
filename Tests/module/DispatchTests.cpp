// SPDX-License-Identifier: MIT
// The object `tarn` and the script site, called as an engine calls them.
#include <climits>
#include <limits>

#include "ModuleTest.h"

class DispatchTest : public ModuleTest {
 protected:
  // Runs the test's body as the script of a run.
  void Script(std::function<void(FakeEngine&)> body) {
    plan.onConnect = std::move(body);
    EXPECT_EQ(1, Run());
  }
};

static RawArgument TextArgument(const std::string& text) { return {1, 0, 0, text}; }

TEST_F(DispatchTest, ArgumentsByType) {
  long number = 5;
  VARIANT byReference = Plain(VT_I4 | VT_BYREF);
  byReference.plVal = &number;
  VARIANT tooBigToText = Plain(VT_UNKNOWN);  // nothing converts it
  const struct {
    VARIANT value;
    std::vector<RawArgument> expected;
  } kCases[] = {
      {Integer(-5), {{2, -5, -5.0, "-5"}}},
      {Integer(LONG_MIN), {{2, INT_MIN, -2147483648.0, "-2147483648"}}},
      {Plain(VT_INT, 12), {{2, 12, 12.0, "12"}}},
      {Plain(VT_I2, 0xFFFE), {{2, -2, -2.0, "-2"}}},
      {Plain(VT_I1, 0x80), {{2, -128, -128.0, "-128"}}},
      {Real(2.5), {{3, 2, 2.5, "2.500000"}}},
      {Real(-2.7), {{3, -2, -2.7, "-2.700000"}}},
      {Real(2147483647.5), {{3, INT_MAX, 2147483647.5, "2147483647.500000"}}},
      {Real(2147483648.0), {{3, INT_MIN, 2147483648.0, "2147483648.000000"}}},
      {Real(-1e20), {{3, INT_MIN, -1e20, "-100000000000000000000.000000"}}},
      {Text(L"a\u00E9\u20AC"), {TextArgument("a\xE9\xAC")}},
      {Text(L"cut\u0100here"), {TextArgument("cut")}},
      {Text(std::wstring(600, L'x').c_str()), {TextArgument(std::string(512, 'x'))}},
      {Text(nullptr), {TextArgument("")}},
      {Plain(VT_BOOL, 0xFFFF), {TextArgument("-1")}},
      {Plain(VT_UI1, 200), {TextArgument("200")}},
      {Plain(VT_CY, 15000), {TextArgument("1.5")}},
      {byReference, {TextArgument("5")}},
      {Plain(VT_NULL), {TextArgument("")}},
      {tooBigToText, {TextArgument("")}},
      {Plain(VT_EMPTY), {}},
      {Plain(VT_DISPATCH), {}},
  };
  Script([&](FakeEngine& engine) {
    for (const auto& given : kCases) {
      host.onCall = [&](unsigned) { EXPECT_EQ(given.expected, host.Arguments()); };
      EXPECT_EQ(S_OK, engine.Call(L"f", {given.value}));
    }
    host.onCall = [&](unsigned) {
      EXPECT_EQ((std::vector<RawArgument>{{2, 1, 1.0, "1"}, TextArgument("a"), {3, 2, 2.5, "2.500000"}, {2, 3, 3.0, "3"}}),
                host.Arguments());
    };
    engine.Call(L"f", {Integer(1), Text(L"a"), Plain(VT_EMPTY), Real(2.5), Integer(3)});
    host.onCall = [&](unsigned) { EXPECT_EQ(300, host.ArgumentCount()); };
    engine.Call(L"f", std::vector<VARIANT>(300, Integer(1)));
  });
}

TEST_F(DispatchTest, Results) {
  const std::string wide(2000, 'w');
  const struct {
    Strings texts;
    unsigned kind;
    VARTYPE type;
    std::wstring text;
  } kCases[] = {{{}, 1, VT_I4, L""},
                {{}, 0, VT_I4, L""},
                {{"one", "two"}, 1, VT_BSTR, L"one"},
                {{"\x80\xE9"}, 1, VT_BSTR, L"\u20AC\u00E9"},
                {{""}, 1, VT_BSTR, L""},
                {{wide.substr(0, 1023)}, 1, VT_BSTR, std::wstring(1023, 'w')},
                {{wide}, 1, VT_BSTR, std::wstring(1023, 'w')},
                {{"text"}, 2, VT_R8, L""}};
  Script([&](FakeEngine& engine) {
    for (const auto& given : kCases) {
      host.onCall = [&](unsigned) {
        EXPECT_EQ(0, host.Field<int>(31 + 8)) << "texts of the call before";
        host.AnswerTexts(given.texts, given.kind);
        host.Field<int>(27) = -42;
      };
      VARIANT result = Plain(VT_R8, 77);
      EXPECT_EQ(S_OK, engine.Call(L"f", {}, &result));
      EXPECT_EQ(given.type, result.vt);
      if (result.vt == VT_I4) EXPECT_EQ(-42, result.lVal);
      if (result.vt == VT_R8) EXPECT_EQ(77, result.llVal) << "left as it was";
      if (result.vt == VT_BSTR) EXPECT_EQ(given.text, std::wstring(result.bstrVal, SysStringLen(result.bstrVal)));
      VariantClear(&result);
    }
    host.onCall = [&](unsigned) { host.Field<int>(31 + 8) = -3; host.Field<unsigned>(23) = 1; };
    VARIANT result = {};
    engine.Call(L"f", {}, &result);
    ASSERT_EQ(VT_BSTR, result.vt) << "a negative count is an empty text";
    EXPECT_EQ(0u, SysStringLen(result.bstrVal));
    VariantClear(&result);
    host.onCall = [&](unsigned) { host.AnswerTexts({"x"}); };
    EXPECT_EQ(S_OK, engine.Call(L"f")) << "no result wanted";
  });
}

TEST_F(DispatchTest, NamesAndIds) {
  Script([&](FakeEngine& engine) {
    IDispatch* tarn = engine.Item();
    LPOLESTR names[] = {const_cast<LPOLESTR>(L"g"), const_cast<LPOLESTR>(L"F"), const_cast<LPOLESTR>(L"f")};
    DISPID ids[] = {-9, -9, -9};
    EXPECT_EQ(E_FAIL, tarn->GetIDsOfNames(IID_NULL, names, 3, 0, ids));
    EXPECT_EQ(0, ids[0]);
    EXPECT_EQ(-9, ids[1]) << "the unknown name's number and later ones are not written";
    EXPECT_EQ(-9, ids[2]);
    EXPECT_EQ(Strings{"Call to unknown macro scripting function:  F"}, host.reports);
    EXPECT_EQ(DISP_E_UNKNOWNINTERFACE, tarn->GetIDsOfNames(IID_IUnknown, names, 1, 0, ids));
    EXPECT_EQ(S_OK, tarn->GetIDsOfNames(IID_NULL, names, 0, 0, nullptr));
    EXPECT_EQ(E_POINTER, tarn->GetIDsOfNames(IID_NULL, names, 1, 0, nullptr));

    host.calls.clear();
    DISPPARAMS none = {};
    EXPECT_EQ(DISP_E_UNKNOWNINTERFACE, tarn->Invoke(7, IID_IUnknown, 0, 1, &none, nullptr, nullptr, nullptr));
    EXPECT_EQ(DISP_E_UNKNOWNINTERFACE, tarn->Invoke(-4, IID_NULL, 0, 1, &none, nullptr, nullptr, nullptr));
    EXPECT_EQ(Strings{}, host.calls);
    EXPECT_EQ(S_OK, tarn->Invoke(1999, IID_NULL, 0, DISPATCH_PROPERTYPUT, nullptr, nullptr, nullptr, nullptr));
    EXPECT_EQ("call 1999", host.calls.back());
    tarn->Release();
  });
}

TEST_F(DispatchTest, TheObjectItself) {
  Script([&](FakeEngine& engine) {
    IDispatch* tarn = engine.Item();
    for (const IID& id : {IID_IUnknown, IID_IDispatch, IID_IErrorInfo}) {
      void* same = nullptr;
      EXPECT_EQ(S_OK, tarn->QueryInterface(id, &same));
      EXPECT_EQ(tarn, same);
      EXPECT_EQ(1u, tarn->Release());
    }
    void* other = tarn;
    EXPECT_EQ(E_NOINTERFACE, tarn->QueryInterface(IID_IActiveScript, &other));
    EXPECT_EQ(nullptr, other);
    EXPECT_EQ(E_POINTER, tarn->QueryInterface(IID_IUnknown, nullptr));

    host.traces.clear();
    UINT count = 99;
    ITypeInfo* info = reinterpret_cast<ITypeInfo*>(1);
    EXPECT_EQ(E_NOTIMPL, tarn->GetTypeInfoCount(&count));
    EXPECT_EQ(E_NOTIMPL, tarn->GetTypeInfo(0, 0, &info));
    EXPECT_EQ(99u, count);
    EXPECT_EQ(reinterpret_cast<ITypeInfo*>(1), info);

    void** table = *reinterpret_cast<void***>(tarn);
    using Supports = HRESULT(__stdcall*)(void*, const IID&);
    using FakeError = HRESULT(__stdcall*)(void*);
    EXPECT_EQ(S_OK, reinterpret_cast<Supports>(table[7])(tarn, IID_IDispatch));
    EXPECT_EQ(E_FAIL, reinterpret_cast<FakeError>(table[9])(tarn));
    EXPECT_EQ((Strings{"GetTypeInfoCount call succeeded.", "GetTypeInfo call succeeded.", "FxFakeError is faking an error."}),
              host.traces);
    IErrorInfo* error = nullptr;
    ASSERT_EQ(S_OK, GetErrorInfo(0, &error));
    BSTR source = nullptr, description = nullptr;
    error->GetSource(&source);
    error->GetDescription(&description);
    EXPECT_STREQ(L"COM", source);
    EXPECT_STREQ(L"This is a fake error generated by the component.", description);
    SetErrorInfo(0, error);
    SysFreeString(source);
    SysFreeString(description);
    error->Release();
    engine.Call(L"f");
    EXPECT_EQ(S_FALSE, GetErrorInfo(0, &error)) << "a call clears the thread's error";

    EXPECT_EQ(0u, tarn->Release());
    EXPECT_EQ(1u, tarn->AddRef()) << "still usable";
    tarn->Release();
  });
}

TEST_F(DispatchTest, TheSite) {
  Script([&](FakeEngine& engine) {
    IActiveScriptSite* site = engine.Site();
    IActiveScriptSiteWindow* window = nullptr;
    IUnknown* unknown = nullptr;
    void* untouched = site;
    EXPECT_EQ(S_OK, site->QueryInterface(IID_IActiveScriptSiteWindow, reinterpret_cast<void**>(&window)));
    EXPECT_EQ(S_OK, window->QueryInterface(IID_IUnknown, reinterpret_cast<void**>(&unknown)));
    EXPECT_EQ(static_cast<IUnknown*>(site), unknown);
    EXPECT_EQ(E_NOINTERFACE, site->QueryInterface(IID_IDispatch, &untouched));
    EXPECT_EQ(site, untouched);
    EXPECT_EQ(E_POINTER, window->QueryInterface(IID_IUnknown, nullptr));
    for (IUnknown* each : {static_cast<IUnknown*>(site), static_cast<IUnknown*>(window)}) {
      EXPECT_EQ(1u, each->AddRef());
      EXPECT_EQ(1u, each->Release());
      EXPECT_EQ(1u, each->Release());
    }

    HWND handle = nullptr;
    EXPECT_EQ(S_OK, window->GetWindow(&handle));
    EXPECT_EQ(host.window, handle);
    EXPECT_EQ(S_OK, window->GetWindow(nullptr));
    EXPECT_EQ(S_OK, window->EnableModeless(TRUE));
    LCID locale = 0;
    BSTR text = nullptr;
    EXPECT_EQ(E_NOTIMPL, site->GetLCID(&locale));
    EXPECT_EQ(E_NOTIMPL, site->GetDocVersionString(&text));
    EXPECT_EQ(E_NOTIMPL, site->OnScriptTerminate(nullptr, nullptr));
    EXPECT_EQ(E_NOTIMPL, site->OnStateChange(SCRIPTSTATE_CONNECTED));
    EXPECT_EQ(E_NOTIMPL, site->OnEnterScript());
    EXPECT_EQ(E_NOTIMPL, site->OnLeaveScript());

    ITypeInfo* const kPoison = reinterpret_cast<ITypeInfo*>(1);
    const struct {
      const wchar_t* name;
      DWORD mask;
      HRESULT result;
    } kItems[] = {{L"tarn", SCRIPTINFO_IUNKNOWN, S_OK},     {L"tarn", SCRIPTINFO_ALL_FLAGS, S_OK},
                  {L"Tarn", SCRIPTINFO_IUNKNOWN, E_NOTIMPL}, {L"", SCRIPTINFO_IUNKNOWN, E_NOTIMPL},
                  {L"tarn", SCRIPTINFO_ITYPEINFO, E_NOTIMPL}, {L"tarn", 0, E_NOTIMPL}};
    for (const auto& asked : kItems) {
      IUnknown* item = kPoison;
      ITypeInfo* type = kPoison;
      EXPECT_EQ(asked.result, site->GetItemInfo(asked.name, asked.mask, &item, &type));
      EXPECT_EQ(asked.mask & SCRIPTINFO_ITYPEINFO ? nullptr : kPoison, type);
      if (asked.result == S_OK) item->Release();
      else EXPECT_EQ(asked.mask & SCRIPTINFO_IUNKNOWN ? nullptr : kPoison, item);
    }
    EXPECT_EQ(E_POINTER, site->GetItemInfo(L"tarn", SCRIPTINFO_IUNKNOWN, nullptr, nullptr));
    EXPECT_EQ(E_POINTER, site->OnScriptError(nullptr));
  });
}

namespace {
class FakeError : public IActiveScriptError {
 public:
  bool answers = true;
  ULONG line = 4;
  LONG column = 7;
  std::wstring lineText = L"x = = 1";
  const wchar_t* description = nullptr;
  BSTR givenDescription = nullptr;

  STDMETHODIMP QueryInterface(REFIID, void**) override { return E_NOINTERFACE; }
  STDMETHODIMP_(ULONG) AddRef() override { return 2; }
  STDMETHODIMP_(ULONG) Release() override { return 1; }
  STDMETHODIMP GetExceptionInfo(EXCEPINFO* info) override {
    if (!answers) return E_FAIL;
    if (description) info->bstrDescription = givenDescription = SysAllocString(description);
    return S_OK;
  }
  STDMETHODIMP GetSourcePosition(DWORD* context, ULONG* atLine, LONG* atColumn) override {
    if (!answers) return E_FAIL;
    *context = 0;
    *atLine = line;
    *atColumn = column;
    return S_OK;
  }
  STDMETHODIMP GetSourceLineText(BSTR* text) override {
    if (!answers) return E_FAIL;
    *text = SysAllocString(lineText.c_str());
    return S_OK;
  }
};
}  // namespace

TEST_F(DispatchTest, ScriptErrors) {
  const std::string file = "Scripting Error :>  File: " + MacroPath();
  Script([&](FakeEngine& engine) {
    FakeError error;
    EXPECT_EQ(S_OK, engine.Site()->OnScriptError(&error));
    error.description = L"no t\u00F6kens";
    error.line = 0;
    error.column = -3;
    error.lineText = std::wstring(600, L'y');
    EXPECT_EQ(S_OK, engine.Site()->OnScriptError(&error));
    EXPECT_STREQ(L"no t\u00F6kens", error.givenDescription) << "the engine's own text";
    SysFreeString(error.givenDescription);
    error.answers = false;
    EXPECT_EQ(S_OK, engine.Site()->OnScriptError(&error));
    EXPECT_EQ((Strings{file + " (5:7) >> x = = 1",
                       file + " (1:-3) >> " + std::string(512, 'y') + "\nReason: no t\xF6kens\n",
                       file + " (1:-1) >> "}),
              host.reports);
  });
}
