// SPDX-License-Identifier: MIT
// The object `tarn` and the script site, called as an engine calls them.
#include <climits>

#include "ModuleTest.h"

class DispatchTest : public ModuleTest {
 protected:
  // Runs the test's body as the script of a run.
  void Script(std::function<void(FakeEngine&)> body) {
    plan.onConnect = std::move(body);
    EXPECT_EQ(1, Run());
  }
};

TEST_F(DispatchTest, Arguments) {
  Script([](FakeEngine& engine) {
    long number = 5;
    VARIANT byReference = Value(VT_I4 | VT_BYREF, reinterpret_cast<LONG_PTR>(&number));
    for (const VARIANT& value : {Value(VT_I4, -5),
                                 Value(VT_I4, LONG_MIN),
                                 Value(VT_INT, 12),
                                 Value(VT_I2, 0xFFFE),
                                 Value(VT_I1, 0x80),
                                 Real(2.5),
                                 Real(-2.7),
                                 Real(2147483647.5),
                                 Real(2147483648.0),
                                 Real(-2147483648.5),
                                 Real(-1e20),
                                 Real(0.0 / 0.0),
                                 Text(L"a\u00E9\u20AC"),
                                 Text(L"cut\u0100here"),
                                 Text(std::wstring(600, 'x')),
                                 Value(VT_BSTR),
                                 Value(VT_BOOL, 0xFFFF),
                                 Value(VT_UI1, 200),
                                 Value(VT_CY, 15000),
                                 byReference,
                                 Value(VT_NULL),
                                 Value(VT_UNKNOWN),
                                 Value(VT_EMPTY),
                                 Value(VT_DISPATCH)})
      engine.Call(L"f", {value});
    engine.Call(L"f", {Value(VT_I4, 1), Text(L"a"), Value(VT_EMPTY), Real(2.5), Value(VT_I4, 3)});
    engine.Call(L"f", std::vector<VARIANT>(70, Value(VT_I4, 1)));
    engine.Call(L"f");
  });
}

namespace {
// An object whose default property is the script's own code, which calls `tarn`.
struct CallingObject : IDispatch {
  FakeEngine* engine = nullptr;
  STDMETHODIMP QueryInterface(REFIID, void**) override { return E_NOINTERFACE; }
  STDMETHODIMP_(ULONG) AddRef() override { return 2; }
  STDMETHODIMP_(ULONG) Release() override { return 1; }
  STDMETHODIMP GetTypeInfoCount(UINT*) override { return E_NOTIMPL; }
  STDMETHODIMP GetTypeInfo(UINT, LCID, ITypeInfo**) override { return E_NOTIMPL; }
  STDMETHODIMP GetIDsOfNames(REFIID, LPOLESTR*, UINT, LCID, DISPID*) override { return E_FAIL; }
  STDMETHODIMP Invoke(DISPID, REFIID, LCID, WORD, DISPPARAMS*, VARIANT* result, EXCEPINFO*,
                      UINT*) override {
    engine->Call(L"g", {Text(L"inner"), Text(L"inner")});
    *result = Text(L"value");
    return S_OK;
  }
};
}  // namespace

TEST_F(DispatchTest, AnArgumentWhoseValueCallsTheHost) {
  Script([](FakeEngine& engine) {
    CallingObject object;
    object.engine = &engine;
    VARIANT inner = Value(VT_DISPATCH, reinterpret_cast<LONG_PTR>(&object));
    VARIANT byReference = Value(VT_VARIANT | VT_BYREF, reinterpret_cast<LONG_PTR>(&inner));
    engine.Call(L"f", {Value(VT_I4, 1), byReference, Value(VT_I4, 2)});
  });
}

TEST_F(DispatchTest, Results) {
  const std::string longText(1022, 'w');
  const struct {
    std::vector<std::string> texts;
    unsigned kind;
  } kAnswers[] = {{{}, 1},
                  {{}, 0},
                  {{"one", "two"}, 1},
                  {{"\x80\xE9"}, 1},
                  {{""}, 1},
                  {{"text"}, 2},
                  {{longText + "y"}, 1},
                  {{longText + "yz"}, 1},
                  {{longText + longText + longText + longText + longText}, 1}};
  Script([&](FakeEngine& engine) {
    for (const auto& answer : kAnswers) {
      host.onCall = [&] {
        EXPECT_EQ(0, host.Field<int>(31 + 8)) << "texts of the call before";
        host.AnswerTexts(answer.texts, answer.kind);
        host.Field<int>(27) = -42;
      };
      engine.Call(L"f");
    }
    host.onCall = [&] {
      host.Field<int>(31 + 8) = -3;  // a negative count is an empty text
      host.Field<unsigned>(23) = 1;
    };
    engine.Call(L"f");
    host.onCall = [&] { host.AnswerTexts({"x"}); };
    IDispatch* tarn = engine.Item();
    EXPECT_EQ(S_OK,
              tarn->Invoke(7, IID_NULL, 0, DISPATCH_METHOD, nullptr, nullptr, nullptr, nullptr));
    tarn->Release();
  });
}

static void Answer(const char* question, HRESULT answer) {
  Log(std::string(question) + ": " + Hex(answer));
}

TEST_F(DispatchTest, NamesAndIds) {
  Script([](FakeEngine& engine) {
    IDispatch* tarn = engine.Item();
    std::wstring known = L"g", unknown = L"F";
    LPOLESTR names[] = {known.data(), unknown.data(), known.data()};
    DISPID ids[] = {-9, -9, -9};
    Answer("an unknown second name", tarn->GetIDsOfNames(IID_NULL, names, 3, 0, ids));
    for (DISPID id : ids) Log(std::to_string(id));
    Answer("another interface", tarn->GetIDsOfNames(IID_IUnknown, names, 1, 0, ids));
    Answer("no names", tarn->GetIDsOfNames(IID_NULL, names, 0, 0, nullptr));
    Answer("no place for numbers", tarn->GetIDsOfNames(IID_NULL, names, 1, 0, nullptr));
    const auto invoke = [&](DISPID id, REFIID riid, WORD flags) {
      return tarn->Invoke(id, riid, 0, flags, nullptr, nullptr, nullptr, nullptr);
    };
    Answer("another interface", invoke(7, IID_IUnknown, DISPATCH_METHOD));
    Answer("a negative number", invoke(-4, IID_NULL, DISPATCH_METHOD));
    Answer("a property put without a result", invoke(1999, IID_NULL, DISPATCH_PROPERTYPUT));
    tarn->Release();
  });
}

TEST_F(DispatchTest, TheObjectItself) {
  Script([](FakeEngine& engine) {
    IDispatch* tarn = engine.Item();
    void* poison = &engine;
    for (const IID& id : {IID_IUnknown, IID_IDispatch, IID_IErrorInfo, IID_IActiveScript}) {
      void* object = poison;
      Answer("QueryInterface", tarn->QueryInterface(id, &object));
      Log(object == tarn ? "itself" : object ? "something else" : "null");
      if (object) Log("Release: " + std::to_string(tarn->Release()));
    }
    Answer("QueryInterface without a pointer", tarn->QueryInterface(IID_IUnknown, nullptr));
    UINT count = 99;
    Answer("GetTypeInfoCount", tarn->GetTypeInfoCount(&count));
    Answer("GetTypeInfo", tarn->GetTypeInfo(0, 0, reinterpret_cast<ITypeInfo**>(&poison)));
    EXPECT_TRUE(count == 99 && poison == &engine) << "written";
    void** table = *reinterpret_cast<void***>(tarn);
    using Supports = HRESULT(__stdcall*)(void*, const IID&);
    Answer("SupportsErrorInfo", reinterpret_cast<Supports>(table[7])(tarn, IID_IDispatch));
    using FakeAnError = HRESULT(__stdcall*)(void*);
    Answer("FxFakeError", reinterpret_cast<FakeAnError>(table[9])(tarn));
    IErrorInfo* error = nullptr;
    ASSERT_EQ(S_OK, GetErrorInfo(0, &error));
    BSTR source = nullptr, description = nullptr;
    error->GetSource(&source);
    error->GetDescription(&description);
    EXPECT_STREQ(L"COM", source);
    EXPECT_STREQ(L"This is a fake error generated by the component.", description);
    SetErrorInfo(0, error);
    engine.Call(L"f");
    EXPECT_EQ(S_FALSE, GetErrorInfo(0, &error)) << "a call clears the thread's error";
    EXPECT_EQ(0u, tarn->Release());
    EXPECT_EQ(1u, tarn->AddRef()) << "still usable";
    tarn->Release();
  });
}

TEST_F(DispatchTest, TheSite) {
  Script([](FakeEngine& engine) {
    IActiveScriptSite* site = engine.site;
    IActiveScriptSiteWindow* window = nullptr;
    void* object = nullptr;
    Answer("the window",
           site->QueryInterface(IID_IActiveScriptSiteWindow, reinterpret_cast<void**>(&window)));
    Answer("the site again", window->QueryInterface(IID_IUnknown, &object));
    Answer("not offered", site->QueryInterface(IID_IDispatch, &object));
    EXPECT_EQ(site, object) << "the same object, and untouched by what is not offered";
    Answer("no pointer", window->QueryInterface(IID_IUnknown, nullptr));
    for (IUnknown* each : {static_cast<IUnknown*>(site), static_cast<IUnknown*>(window)})
      EXPECT_EQ(3u, each->AddRef() + each->Release() + each->Release());
    HWND handle = nullptr;
    Answer("GetWindow", window->GetWindow(&handle));
    EXPECT_EQ(reinterpret_cast<HWND>(0x1234), handle);
    Answer("GetWindow without a pointer", window->GetWindow(nullptr));
    Answer("EnableModeless", window->EnableModeless(TRUE));
    Answer("GetLCID", site->GetLCID(nullptr));
    Answer("GetDocVersionString", site->GetDocVersionString(nullptr));
    Answer("OnScriptTerminate", site->OnScriptTerminate(nullptr, nullptr));
    Answer("OnStateChange", site->OnStateChange(SCRIPTSTATE_CONNECTED));
    Answer("OnEnterScript", site->OnEnterScript());
    Answer("OnLeaveScript", site->OnLeaveScript());
    Answer("OnScriptError without an error", site->OnScriptError(nullptr));
    Answer("GetItemInfo without pointers",
           site->GetItemInfo(L"tarn", SCRIPTINFO_IUNKNOWN, nullptr, nullptr));
    for (const wchar_t* name : {L"tarn", L"Tarn", L"tarn2", static_cast<const wchar_t*>(nullptr)})
      for (DWORD mask = 0; mask <= SCRIPTINFO_ALL_FLAGS; ++mask) {
        ITypeInfo* type = reinterpret_cast<ITypeInfo*>(1);
        IUnknown* item = type;
        Answer(("GetItemInfo " + std::to_string(mask)).c_str(),
               site->GetItemInfo(name, mask, &item, &type));
        const bool given = item && item != reinterpret_cast<IUnknown*>(1);
        Log(std::string("  item ") +
            (given  ? "given"
             : item ? "untouched"
                    : "null") +
            (type ? ", type untouched" : ", type null"));
        if (given) item->Release();
      }
  });
}

namespace {
struct FakeError : IActiveScriptError {
  bool answers = true;
  ULONG line = 4;
  LONG column = 7;
  std::wstring lineText = L"x = = 1";
  BSTR description = nullptr;

  STDMETHODIMP QueryInterface(REFIID, void**) override { return E_NOINTERFACE; }
  STDMETHODIMP_(ULONG) AddRef() override { return 2; }
  STDMETHODIMP_(ULONG) Release() override { return 1; }
  STDMETHODIMP GetExceptionInfo(EXCEPINFO* info) override {
    info->bstrDescription = description;
    return answers ? S_OK : E_FAIL;
  }
  STDMETHODIMP GetSourcePosition(DWORD* context, ULONG* atLine, LONG* atColumn) override {
    if (!answers) return E_FAIL;
    *context = 0;
    *atLine = line;
    *atColumn = column;
    return S_OK;
  }
  STDMETHODIMP GetSourceLineText(BSTR* text) override {
    if (answers) *text = SysAllocString(lineText.c_str());
    return answers ? S_OK : E_FAIL;
  }
};
}  // namespace

TEST_F(DispatchTest, ScriptErrors) {
  Script([](FakeEngine& engine) {
    FakeError error;
    EXPECT_EQ(S_OK, engine.site->OnScriptError(&error));
    error.description = SysAllocString(L"no t\u00F6kens");
    error.line = 0;
    error.column = -3;
    error.lineText = std::wstring(600, 'y');
    EXPECT_EQ(S_OK, engine.site->OnScriptError(&error));
    EXPECT_STREQ(L"no t\u00F6kens", error.description) << "the engine's own text";
    SysFreeString(error.description);
    error.description = nullptr;
    error.answers = false;
    EXPECT_EQ(S_OK, engine.site->OnScriptError(&error));
  });
}
