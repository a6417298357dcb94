// SPDX-License-Identifier: MIT
// The engine as a COM object and as a script engine: states, code, errors, functions for the host.
#include <algorithm>
#include <thread>

#include "EngineHost.h"

// What a call answers; a failure has to overwrite its out-parameter with null.
static std::string Asked(const std::function<HRESULT(void**)>& call) {
  void* object = reinterpret_cast<void*>(0xBAD);
  const HRESULT result = call(&object);
  EXPECT_EQ(SUCCEEDED(result), object != nullptr);
  if (SUCCEEDED(result)) static_cast<IUnknown*>(object)->Release();
  return Hex(result);
}
static std::string Queried(IUnknown* unknown, REFIID id) {
  EXPECT_EQ(E_POINTER, unknown->QueryInterface(id, nullptr));
  return Asked([&](void** object) { return unknown->QueryInterface(id, object); });
}

TEST(Protocol, ClassAndInterfaces) {
  const auto get = [](REFCLSID id, REFIID riid) {
    return Asked([&](void** object) { return GetClassObject(id, riid, object); });
  };
  EXPECT_EQ("80040111", get(IID_IUnknown, IID_IClassFactory));
  EXPECT_EQ("80004002", get(kEngineClass, IID_IDispatch));
  EXPECT_EQ(E_POINTER, GetClassObject(kEngineClass, IID_IClassFactory, nullptr));
  IClassFactory* factory = nullptr;
  ASSERT_EQ(S_OK, GetClassObject(kEngineClass, IID_IUnknown, reinterpret_cast<void**>(&factory)));
  EXPECT_EQ("00000000", Queried(factory, IID_IClassFactory));
  EXPECT_EQ("80004002", Queried(factory, IID_IDispatch));
  const auto create = [&](IUnknown* outer, REFIID riid) {
    return Asked([&](void** object) { return factory->CreateInstance(outer, riid, object); });
  };
  EXPECT_EQ("00000000", create(nullptr, kParseId));
  EXPECT_EQ("80004002", create(nullptr, IID_IDispatch));
  EXPECT_EQ("80040110", create(factory, IID_IUnknown));
  EXPECT_EQ(E_POINTER, factory->CreateInstance(nullptr, IID_IUnknown, nullptr));
  factory->Release();

  Host host;
  host.Open();
  for (const IID& id : {__uuidof(IActiveScript), kParseId, IID_IObjectSafety}) {
    IUnknown *each = nullptr, *identity = nullptr, *first = nullptr;
    ASSERT_EQ(S_OK, host.script->QueryInterface(id, reinterpret_cast<void**>(&each)));
    each->QueryInterface(IID_IUnknown, reinterpret_cast<void**>(&identity));
    host.script->QueryInterface(IID_IUnknown, reinterpret_cast<void**>(&first));
    EXPECT_EQ(first, identity);
    for (IUnknown* unknown : {each, identity, first}) {
      EXPECT_EQ("80004002", Queried(unknown, IID_IDispatch));
      unknown->Release();
    }
  }
  // A macro can do what its user can: nothing is safe.
  IObjectSafety* safety = nullptr;
  host.script->QueryInterface(IID_IObjectSafety, reinterpret_cast<void**>(&safety));
  for (const IID& id : {kParseId, IID_IDispatch}) {
    const HRESULT expected = id == kParseId ? S_OK : E_NOINTERFACE;
    DWORD supported = 7, enabled = 7;
    EXPECT_EQ(expected, safety->GetInterfaceSafetyOptions(id, &supported, &enabled));
    EXPECT_EQ(0u, supported | enabled);
    EXPECT_EQ(expected, safety->SetInterfaceSafetyOptions(id, 3, 0));
  }
  EXPECT_EQ(E_FAIL, safety->SetInterfaceSafetyOptions(kParseId, 3, 1));
  EXPECT_EQ(E_POINTER, safety->GetInterfaceSafetyOptions(kParseId, nullptr, nullptr));
  safety->Release();
  host.Close();
  EXPECT_EQ("", TakeLog());
}

TEST(Protocol, StatesInOrder) {
  Host host;
  host.verbose = true;
  host.item.Add("f");
  // The notifications, the result and the state that it is in then.
  const auto set = [&](int state) {
    const HRESULT result = host.script->SetScriptState(static_cast<SCRIPTSTATE>(state));
    SCRIPTSTATE now = SCRIPTSTATE_UNINITIALIZED;
    EXPECT_EQ(S_OK, host.script->GetScriptState(&now));
    return TakeLog() + (result ? " " + Hex(result) : "") + " -> " + std::to_string(now);
  };
  enum { kUninitialized, kStarted, kConnected, kDisconnected, kClosed, kInitialized, kUnknown };
  host.Create();
  EXPECT_EQ(S_OK, host.parse->InitNew());
  EXPECT_EQ("", TakeLog());
  EXPECT_EQ(S_OK, host.script->SetScriptSite(&host));
  EXPECT_EQ("state 5", TakeLog());
  host.Close();
  EXPECT_EQ("state 4", TakeLog());

  host.Create();
  EXPECT_EQ(S_OK, host.script->SetScriptSite(&host));
  EXPECT_EQ(" 8000FFFF -> 0", set(kStarted));  // InitNew first
  EXPECT_EQ(S_OK, host.parse->InitNew());
  EXPECT_EQ("state 5", TakeLog());
  EXPECT_EQ(" 8000FFFF -> 5", set(kDisconnected));
  EXPECT_EQ(" 80070057 -> 5", set(kUnknown));
  host.script->AddNamedItem(L"item", SCRIPTITEM_ISVISIBLE | SCRIPTITEM_ISPERSISTENT);
  EXPECT_EQ(S_OK, host.Parse("@item.f(1, @kept, defined?(kept))\n@kept = 1\ndef kept = 1",
                             SCRIPTTEXT_ISPERSISTENT));
  EXPECT_EQ(S_OK, host.Parse("@item.f(2, @kept)"));
  EXPECT_EQ("state 1; enter; item.f(I4 1, EMPTY, EMPTY); item.f(I4 2, I4 1); leave -> 1",
            set(kStarted));
  EXPECT_EQ(" 00000001 -> 1", set(kStarted));
  EXPECT_EQ("state 2 -> 2", set(kConnected));
  EXPECT_EQ("state 3 -> 3", set(kDisconnected));
  EXPECT_EQ("state 2 -> 2", set(kConnected));
  EXPECT_EQ(S_OK, host.Parse("@item.f(3, @kept)"));
  EXPECT_EQ("enter; item.f(I4 3, I4 1); leave", TakeLog());
  // Only persistent code runs again, with an empty top level.
  EXPECT_EQ("state 3; state 5 -> 5", set(kInitialized));
  EXPECT_EQ(1u, host.item.references);
  EXPECT_EQ("state 2; enter; item.f(I4 1, EMPTY, EMPTY); leave -> 2", set(kConnected));
  EXPECT_EQ("state 3; state 5; state 4 -> 4", set(kClosed));
  EXPECT_EQ(" 8000FFFF -> 4", set(kConnected));
  host.Close();

  // Back to the first state, which also releases the site.
  host.Open();
  host.Parse("@item.f");
  EXPECT_EQ("state 5; state 2; enter; item.f(); leave -> 2", set(kConnected));
  EXPECT_EQ("state 3; state 5; state 0 -> 0", set(kUninitialized));
  EXPECT_EQ(1u, host.references);
  host.Close();

  // From inside a run the states go no lower than that; Close ends the macro first.
  host.item.Does("lower", [&] {
    EXPECT_EQ(E_UNEXPECTED, host.script->SetScriptState(SCRIPTSTATE_INITIALIZED));
    EXPECT_EQ(E_UNEXPECTED, host.script->SetScriptState(SCRIPTSTATE_UNINITIALIZED));
    EXPECT_EQ(S_OK, host.script->SetScriptState(SCRIPTSTATE_DISCONNECTED));
    SCRIPTTHREADSTATE thread = SCRIPTTHREADSTATE_NOTINSCRIPT;
    EXPECT_EQ(S_OK, host.script->GetScriptThreadState(SCRIPTTHREADID_BASE, &thread));
    EXPECT_EQ(SCRIPTTHREADSTATE_RUNNING, thread);
  });
  host.item.Does("close", [&] { EXPECT_EQ(S_OK, host.script->Close()); });
  host.Open(), TakeLog();
  host.Parse("@item.lower; @item.close; @item.f");
  EXPECT_EQ(
      "state 2; enter; item.lower(); state 3; item.close(); leave; state 5; state 4"
      " 80004004 -> 4",
      set(kConnected));
  host.Close();
  // Released without a Close.
  host.Open();
  host.parse->Release();
  EXPECT_EQ(0u, host.script->Release());
  host.script = nullptr;
  EXPECT_EQ("state 5; state 4", TakeLog());
  EXPECT_EQ(1u, host.references);
}

TEST(Protocol, WrongUse) {
  Host host, other;
  const auto functions = [&](const wchar_t* item) {
    return Asked([&](void** object) {
      return host.script->GetScriptDispatch(item, reinterpret_cast<IDispatch**>(object));
    });
  };
  const auto parse = [&](const wchar_t* code, const wchar_t* item) {
    return host.parse->ParseScriptText(code, item, nullptr, nullptr, 0, 0, 0, nullptr, nullptr);
  };
  const auto unusable = [&] {
    EXPECT_EQ(E_UNEXPECTED, host.script->SetScriptState(SCRIPTSTATE_CONNECTED));
    EXPECT_EQ(E_UNEXPECTED, host.script->AddNamedItem(L"x", SCRIPTITEM_ISVISIBLE));
    EXPECT_EQ("8000FFFF", functions(nullptr));
    VARIANT result = Value(VT_I4, 0xBAD);
    EXPECT_EQ(E_UNEXPECTED, host.Parse("1", SCRIPTTEXT_ISEXPRESSION, &result));
    EXPECT_EQ(VT_EMPTY, result.vt);
    void* site = &host;
    EXPECT_EQ(S_FALSE, host.script->GetScriptSite(IID_IUnknown, &site));
    EXPECT_EQ(nullptr, site);
  };
  host.Create();
  unusable();
  EXPECT_EQ(E_POINTER, host.script->SetScriptSite(nullptr));
  EXPECT_EQ(S_OK, host.script->SetScriptSite(&host));
  EXPECT_EQ(E_UNEXPECTED, host.Parse("1"));  // InitNew first
  EXPECT_EQ(E_UNEXPECTED, host.script->SetScriptSite(&other));
  EXPECT_EQ(S_OK, host.parse->InitNew());
  EXPECT_EQ(E_UNEXPECTED, host.parse->InitNew());

  for (const wchar_t* name : {L"", L"1st", L"two words", L"x-y", L"x.y", L"@x", L"x="})
    EXPECT_EQ(E_INVALIDARG, host.script->AddNamedItem(name, SCRIPTITEM_ISVISIBLE)) << name;
  EXPECT_EQ(E_INVALIDARG, host.script->AddNamedItem(L"x", 0x80000000));
  EXPECT_EQ(S_OK, host.script->AddNamedItem(L"item", SCRIPTITEM_ISVISIBLE));
  EXPECT_EQ("8000FFFF", functions(nullptr));  // not started
  EXPECT_EQ(S_OK, host.Start());
  EXPECT_EQ(E_INVALIDARG, parse(L"1", L"other"));
  EXPECT_EQ(S_OK, parse(L"1", L"item"));
  EXPECT_EQ("80070057", functions(L"other"));
  EXPECT_EQ("00000000", functions(L"item"));
  EXPECT_EQ(E_INVALIDARG, host.script->InterruptScriptThread(12345, nullptr, 0));
  for (const HRESULT result :
       {parse(nullptr, nullptr), host.script->AddNamedItem(nullptr, 0),
        host.script->GetScriptDispatch(nullptr, nullptr), host.script->GetScriptState(nullptr),
        host.script->GetScriptSite(IID_IUnknown, nullptr),
        host.script->GetCurrentScriptThreadID(nullptr), host.script->GetScriptThreadID(0, nullptr),
        host.script->GetScriptThreadState(SCRIPTTHREADID_BASE, nullptr)})
    EXPECT_EQ(E_POINTER, result);
  void* site = nullptr;
  EXPECT_EQ(E_NOINTERFACE, host.script->GetScriptSite(IID_IDispatch, &site));
  EXPECT_EQ(S_OK, host.script->GetScriptSite(__uuidof(IActiveScriptSite), &site));
  EXPECT_EQ(&host, site);
  host.Release();

  // On other threads, while it is open and when Ruby has been used on this one.
  std::thread([&] {
    SCRIPTSTATE state = SCRIPTSTATE_CLOSED;
    EXPECT_EQ(S_OK, host.script->GetScriptState(&state));
    EXPECT_EQ(E_UNEXPECTED, host.Parse("1"));
    EXPECT_EQ(E_UNEXPECTED, host.script->Close());
    EXPECT_EQ(E_UNEXPECTED, host.parse->InitNew());
    Host late;
    EXPECT_EQ("error: Ruby macros run on the thread that ran the first one.", late.Run("1"));
  }).join();

  EXPECT_EQ(S_OK, host.script->Close());
  EXPECT_EQ(S_FALSE, host.script->Close());
  unusable();
  EXPECT_EQ(E_UNEXPECTED, host.parse->InitNew());
  EXPECT_EQ(E_UNEXPECTED, host.script->SetScriptSite(&host));
  EXPECT_EQ(E_UNEXPECTED, host.script->InterruptScriptThread(SCRIPTTHREADID_BASE, nullptr, 0));
  host.Close();
  EXPECT_EQ(1u, other.references);
  EXPECT_EQ("", TakeLog());
}

TEST(Protocol, CodeAndItsValue) {
  Host host;
  host.verbose = true;
  host.item.Add("f");
  VARIANT result = Value(VT_I4, 0xBAD);
  const auto value = [&](const char* code, DWORD flags = SCRIPTTEXT_ISEXPRESSION) {
    result = Value(VT_I4, 0xBAD);
    EXPECT_EQ(S_OK, host.Parse(code, flags, &result));
    const std::string shown = Show(result);
    VariantClear(&result);
    return TakeLog() + " " + shown;
  };
  host.Open();
  EXPECT_EQ("state 5 EMPTY", value("@item.f 1"));  // it waits for the start
  host.Start();
  EXPECT_EQ("state 2; enter; item.f(I4 1); leave", TakeLog());
  EXPECT_EQ("enter; leave I4 42", value("6 * 7"));
  EXPECT_EQ("enter; leave EMPTY", value("def twice(x) = [2 * x, 'a']", 0));
  EXPECT_EQ("enter; leave [I4 8, 'a']", value("twice 4"));
  EXPECT_EQ("enter; leave EMPTY", value("{}", 0));  // cannot be passed, and is not asked for
  EXPECT_EQ(S_OK, host.Parse("Hash.new", SCRIPTTEXT_ISEXPRESSION));
  EXPECT_EQ(kReported, host.Parse("Hash.new", SCRIPTTEXT_ISEXPRESSION, &result));
  EXPECT_EQ(
      "enter; leave; enter; error: no Hash can be passed to a COM object; convert it first "
      "(TypeError); leave",
      TakeLog());
  // A site that takes no errors: the caller gets them, with new strings.
  host.errorAnswer = E_FAIL;
  EXCEPINFO exception = {};
  EXPECT_EQ(DISP_E_EXCEPTION, host.Parse("raise 'oops'", 0, &result, &exception));
  EXPECT_EQ(0u, std::wstring(exception.bstrDescription).find(L"oops (RuntimeError)"));
  EXPECT_TRUE(FAILED(exception.scode));
  for (BSTR text : {exception.bstrDescription, exception.bstrSource, exception.bstrHelpFile})
    SysFreeString(text);
  EXPECT_EQ(DISP_E_EXCEPTION, host.Parse("raise 'oops'"));
  host.Close();
  TakeLog();
}

// Where an error is, counted from 0, with columns in characters; and that Enter and Leave come in
// pairs.
TEST(Protocol, ErrorsAndTheirPlaces) {
  Host host;
  host.item.Add("f");
  CheckTranscript("errors.txt", [&](const std::string& macro) {
    host.error = {};
    host.Open(), TakeLog();
    host.verbose = true, host.Parse(macro), host.Start(), host.verbose = false;
    const std::string log = TakeLog(), &text = host.error.text;
    host.Close();
    EXPECT_EQ(text.empty(), SUCCEEDED(host.error.code));
    if (text.empty()) return log;
    const size_t first = std::min(text.find('\n'), text.size());
    const size_t end = text.find("\n\tfrom", first + 150);  // many in a recursion
    return log + " " + std::to_string(host.error.line) + ":" + std::to_string(host.error.column) +
           " of [" + host.error.lineText + "]" + text.substr(first, end - first);
  });
  // The first line's number and the cookie.
  host.Open();
  host.Parse("def f = raise('oops')\n", 0, nullptr, nullptr, 11, 100);
  host.Parse("\nf", 0, nullptr, nullptr, 22, 200);
  host.Start();
  EXPECT_EQ("oops (RuntimeError)\n\tfrom macro:101:in `f'\n\tfrom macro2:202:in `<main>'",
            host.error.text);
  const auto place = [&] {
    return std::to_string(host.error.line) + ":" + std::to_string(host.error.column) + " [" +
           host.error.lineText + "] " + std::to_string(host.error.cookie);
  };
  EXPECT_EQ("100:8 [def f = raise('oops')] 11", place());
  EXPECT_EQ(kReported, host.Parse("\n1 +", 0, nullptr, nullptr, 33, 300));
  EXPECT_EQ("301:0 [1 +] 33", place());
  // Of another object, with a name that is missed; and more lines than CRuby counts by itself.
  host.Parse("x = 5\n  x.missing", 0, nullptr, nullptr, 44, 400);
  EXPECT_EQ("401:3 [  x.missing] 44", place());
  for (const int line : {70'000, 140'000}) {
    host.Parse(std::string(line - 500, '\n') + "1; raise 'far'", 0, nullptr, nullptr, 55, 500);
    EXPECT_EQ(std::to_string(line) + ":3 [1; raise 'far'] 55", place());
  }
  host.Parse(std::string(70'000, '\n') + "raise 'far'");
  EXPECT_NE(host.error.text.npos, host.error.text.find(":70001:in `<main>'")) << host.error.text;
  host.Close();
  // Frames of a macro inside another one are its own, also those of a fiber.
  Host outer;
  outer.item.Does("nest", [&] {
    host.Run("def r(n) = n.zero? ? raise('x') : r(n - 1)\nFiber.new { r 12 }.resume");
    EXPECT_EQ(14, std::count(host.error.text.begin(), host.error.text.end(), '\t'));
    host.Run("def r = raise('x')\nr");
    EXPECT_EQ("x (RuntimeError)\n\tfrom macro:1:in `r'\n\tfrom macro:2:in `<main>'",
              host.error.text);
    TakeLog();
  });
  EXPECT_EQ("", outer.Run("def a = @item.nest\ndef b = a\nb"));
  // Columns are units of the host's own text.
  for (const char* const name : {"item", "tarn"}) {
    Host each(name);
    each.Run("'\xC3\xA4\xF0\x9F\x98\x80'; raise 'x'");
    EXPECT_EQ(each.itemName == "tarn" ? 10 : 7, each.error.column);
  }
  TakeLog();
}

TEST(Protocol, FunctionsForTheHost) {
  Host host;
  host.verbose = true;
  host.Open();
  host.Parse(
      "def add(a, b = 1) = a + b\ndef fails = raise('oops')\ndef self.own = @item\n"
      "def gr\xC3\xB6\xC3\x9F\x65(*x) = x\nclass Inner; def hidden = 1; end");
  host.Start();
  TakeLog();
  IDispatch* functions = nullptr;
  ASSERT_EQ(S_OK, host.script->GetScriptDispatch(nullptr, &functions));
  const auto call = [&](const wchar_t* name, std::vector<VARIANT> arguments) {
    DISPID id = 0xBAD;
    LPOLESTR names[] = {const_cast<wchar_t*>(name)};
    HRESULT result = functions->GetIDsOfNames(IID_NULL, names, 1, LOCALE_USER_DEFAULT, &id);
    EXPECT_EQ(FAILED(result), id == DISPID_UNKNOWN);
    if (FAILED(result)) return Hex(result);
    std::reverse(arguments.begin(), arguments.end());
    DISPPARAMS parameters = {arguments.data(), nullptr, static_cast<UINT>(arguments.size()), 0};
    VARIANT value = {};
    result = functions->Invoke(id, IID_NULL, LOCALE_USER_DEFAULT, DISPATCH_METHOD, &parameters,
                               &value, nullptr, nullptr);
    const std::string shown = FAILED(result) ? Hex(result) : Show(value);
    VariantClear(&value);
    return shown + " " + TakeLog();
  };
  EXPECT_EQ("I4 5 enter; leave", call(L"add", {Value(VT_I4, 2), Value(VT_I4, 3)}));
  EXPECT_EQ("I4 3 enter; leave", call(L"add", {Value(VT_I4, 2)}));
  EXPECT_EQ("[I4 1, 'x'] enter; leave", call(L"gr\u00F6\u00DFe", {Value(VT_I4, 1), Text(L"x")}));
  EXPECT_EQ("DISPATCH enter; leave", call(L"own", {}));
  EXPECT_EQ("80020101 enter; error: oops (RuntimeError); leave", call(L"fails", {}));
  for (const wchar_t* name : {L"hidden", L"puts", L"exit", L"inspect", L"no such", L""})
    EXPECT_EQ("80020006", call(name, {})) << name;
  DISPPARAMS none = {};
  const auto invoke = [&](DISPPARAMS* parameters) {
    return functions->Invoke(77, IID_NULL, 0, DISPATCH_METHOD, parameters, 0, 0, 0);
  };
  EXPECT_EQ(E_POINTER, invoke(nullptr));
  EXPECT_EQ(DISP_E_MEMBERNOTFOUND, invoke(&none));
  EXPECT_EQ(S_OK, host.script->Close());
  EXPECT_EQ("8000FFFF", call(L"other", {}));
  EXPECT_EQ(0u, functions->Release());
  TakeLog();
  host.Close();
  EXPECT_EQ("", TakeLog());
}
