// SPDX-License-Identifier: MIT
// The object `tarn` and the script site, called as an engine calls them.
#include <bit>
#include <cfloat>
#include <climits>
#include <clocale>
#include <cmath>
#include <random>

#include "ModuleTest.h"

using DispatchTest = ModuleTest;

static void Answers(const std::string& whose, const std::vector<HRESULT>& answers) {
  for (HRESULT answer : answers) Log(whose + " answers " + Hex(answer));
}

// What became of a pointer that was `before`.
static std::string State(const void* now, const void* before) {
  return now == before ? "untouched" : now ? "given" : "null";
}

TEST_F(DispatchTest, ArgumentsAndResults) {
  const std::pair<VARTYPE, int> values[] = {
      {VT_I4, -5},   {VT_I4, LONG_MIN}, {VT_INT, 12},    {VT_I2, 0xFFFE}, {VT_I1, 0x80},
      {VT_BSTR, 0},  {VT_BOOL, 1},      {VT_UI1, 200},   {VT_CY, 15000},  {VT_NULL, 0},
      {VT_EMPTY, 0}, {VT_UNKNOWN, 0},   {VT_DISPATCH, 0}};
  const double reals[] = {2.5,           -2.7,          2147483647.5, 2147483648.0,
                          -2147483648.5, -2147483649.0, -1e20,        0.0 / 0.0};
  const std::wstring texts[] = {L"a\u00E9\u20AC", L"cut\u0100here", std::wstring(600, 'x')};
  const std::string w1022(1022, 'w'), w5110(5110, 'w');
  const std::pair<std::vector<std::string>, unsigned> answers[] = {
      {{}, 1},       {{}, 0},       {{"one", "two"}, 1}, {{"\x80\xE9"}, 1},   {{""}, 1},
      {{"text"}, 2}, {{"text"}, 0}, {{w1022 + "y"}, 1},  {{w1022 + "yz"}, 1}, {{w5110}, 1}};
  Script([&] {
    for (const auto& [type, bits] : values) Call(L"f", {Value(type, bits)});
    for (double real : reals) Call(L"f", {Value(VT_R8, real)});
    for (auto& text : texts) Call(L"f", {Value(VT_BSTR, SysAllocString(text.c_str()))});
    VARIANT one = Value(VT_I4, 1), object = Value(VT_DISPATCH, Item());
    Call(L"f", {one, Value(VT_R8, 2.5), Value(VT_EMPTY, 0), Value(VT_I4 | VT_BYREF, &one.lVal),
                Value(VT_I4, 3)});
    Call(L"f", std::vector<VARIANT>(70, one));
    // An object's value is its default property: that of `tarn` is a call of function 0.
    on["call 0"] = [&] { host.AnswerTexts({"value"}); };
    Call(L"f", {one, Value(VT_VARIANT | VT_BYREF, &object), Value(VT_I4, 2)});

    for (const auto& answer : answers) {
      At<int>(host.context, 27) = -42;
      on["call 7"] = [&] { host.AnswerTexts(answer.first, answer.second); };
      Call(L"f");
    }
    on["call 7"] = [&] { At<int>(host.context, 31 + 8) = -3; };  // a negative count: no text
    Call(L"f");
  });
}

namespace {
// What a host has put among the arguments.
void* foreign[12];
void* THISCALL DeleteForeign(void* element, unsigned) {
  EXPECT_TRUE(!foreign[2] && !foreign[3]) << "written to";
  Log("a host's element was deleted");
  return element;
}
}  // namespace

// Of one call's arguments nothing shows in the next one's.
TEST_F(DispatchTest, EachCallHasItsArgumentsAlone) {
  auto table = Table(DeleteForeign);
  foreign[0] = table.data();
  const auto text = [](const wchar_t* units) { return Value(VT_BSTR, SysAllocString(units)); };
  const auto items = [&] { return At<void**>(host.context, 51 + 16); };
  const VARIANT one = Value(VT_I4, 1), real = Value(VT_R8, -2.5);
  Script([&] {
    Call(L"f", {real, text(L"a longer text"), one});
    Call(L"f", {text(L"t"), one, real});
    Call(L"f", {one});
    Call(L"f", {text(L"")});
    Call(L"f");
    Call(L"f", {real, one, Value(VT_BOOL, 1)});
    for (int place : {0, 1}) {
      on["call 7"] = [&] { items()[place] = foreign; };
      Call(L"f", {one, one});
      on.erase("call 7");
      Call(L"f", {real});
    }

    // Elements that the host removes from the list, or that the list does not own, stay unchanged.
    std::vector<void*> kept;
    for (unsigned owns : {1u, 0u}) {
      on["call 7"] = [&] {
        kept.push_back(items()[0]);
        At<unsigned>(host.context, 51 + 12) = owns;
        if (owns) items()[0] = nullptr;
      };
      Call(L"f", {text(L"kept")});
      on.erase("call 7");
      Call(L"f", {text(L"new")});
    }
    At<unsigned>(host.context, 51 + 12) = 1;
    for (void* each : kept) {
      EXPECT_STREQ("kept", At<char*>(each, 24 + 8));
      CallSlot<void*>(each, 0, 1);
    }
  });
}

// Numbers have the texts that the C runtime writes, whatever its decimal point and precision, and no
// floating-point exception is raised, although each of them would end the run.
TEST_F(DispatchTest, NumbersAsText) {
  std::mt19937_64 random(1);
  // Takes a real as its bits: loading it could change it.
  void* const address =
      reinterpret_cast<void*>(GetProcAddress(GetModuleHandleA("msvcrt"), "_snprintf"));
  const auto print = reinterpret_cast<int (*)(char*, size_t, const char*, ...)>(address);
  char expected[400];
  IDispatch* tarn = nullptr;
  const auto compare = [&](VARIANT value) {
    const bool real = value.vt == VT_R8;
    print(expected, sizeof expected, real ? "%lf" : "%ld", value.llVal);
    DISPPARAMS params = {&value, nullptr, 1, 0};
    _clearfp();
    _control87(0, _MCW_EM);
    tarn->Invoke(7, IID_NULL, 0, DISPATCH_METHOD, &params, nullptr, nullptr, nullptr);
  };
  // The first that the host gets after the conversion.
  on["fix CRLF"] = [] { _control87(_MCW_EM, _MCW_EM); };
  on["call 7"] = [&] {
    void* const argument = At<void**>(host.context, 51 + 16)[0];
    EXPECT_STREQ(expected, At<char*>(argument, 24 + 8));
  };
  Script([&] {
    tarn = Item();
    muted = true;
    // Microsoft's compilers set 53 bits, Direct3D 24.
    for (const auto& [locale, precision] :
         {std::pair("C", _PC_64), {"German", _PC_53}, {"C", _PC_24}}) {
      ASSERT_TRUE(std::setlocale(LC_NUMERIC, locale));
      for (int i = 0; i < 10000; ++i) {
        _controlfp(_PC_64, _MCW_PC);
        const int bits = static_cast<int>(random());
        // Decimals, ties at the seventh place and what lies next to them, and any bits at all.
        const double decimal = bits / 2e7, tie = (bits | 1) / 2e6 + bits % 1000;
        const double values[] = {decimal,
                                 std::ldexp(bits, -7 - i % 30),
                                 tie,
                                 std::nextafter(tie, 1e9),
                                 std::nextafter(tie, -1e9),
                                 tie + 4e-8,
                                 std::ldexp(bits, static_cast<int>(random() % 130) - 90)};
        _controlfp(precision, _MCW_PC);
        compare(Value(VT_I4, bits >> i % 32));
        for (const double& each : values) compare(Value(VT_R8, std::bit_cast<long long>(each)));
        compare(Value(VT_R8, random()));
      }
      // Zeros, denormals, infinities and what is no number, then the ends of the fast way.
      for (unsigned long long bits :
           {0x0ull, 0x1ull, 0xFFFFFFFFFFFFFull, 0x7FF0ull << 48, 0x7FF8ull << 48,
            0x7FF0000000000001ull, 0x3EB0C6F7A0B5ED8Dull, 0x41DFFFFFFFC00000ull,
            0x41DFFFFFFFFFFFFFull, 0x41E0000000000000ull, 0x3FEFFFFF79C842FAull})
        for (unsigned long long sign : {0ull, 1ull << 63})
          // Wine's own %lf writes 10.000000 for 0.99999975 at 24 bits.
          if (precision != _PC_24 || bits != 0x3FEFFFFF79C842FAull)
            compare(Value(VT_R8, bits | sign));
    }
    _controlfp(_PC_64, _MCW_PC);
    std::setlocale(LC_NUMERIC, "C");
    on.erase("call 7"), on.erase("fix CRLF");
    muted = false;
  });
}

TEST_F(DispatchTest, TheObject) {
  Script([] {
    IDispatch* tarn = Item();
    for (const IID& id : {IID_IUnknown, IID_IDispatch, IID_IErrorInfo, IID_IActiveScript}) {
      void* object = site;
      Answers("QueryInterface", {tarn->QueryInterface(id, &object)});
      Log(object == tarn ? "itself, then " + std::to_string(tarn->Release()) : State(object, site));
    }
    std::wstring known = L"g", unknown = L"F";
    LPOLESTR names[] = {known.data(), unknown.data(), known.data()};
    DISPID ids[] = {-9, -9, -9};
    Answers("GetIDsOfNames", {tarn->GetIDsOfNames(IID_NULL, names, 3, 0, ids),
                              tarn->GetIDsOfNames(IID_IUnknown, names, 1, 0, ids),
                              tarn->GetIDsOfNames(IID_NULL, names, 0, 0, nullptr),
                              tarn->GetIDsOfNames(IID_NULL, names, 1, 0, nullptr)});
    for (DISPID id : ids) Log(std::to_string(id));
    const auto invoke = [&](DISPID id, REFIID riid) {
      return tarn->Invoke(id, riid, 0, DISPATCH_PROPERTYPUT, nullptr, nullptr, nullptr, nullptr);
    };
    auto* const end =
        static_cast<VARIANT*>(VirtualAlloc(nullptr, 8192, MEM_RESERVE, PAGE_NOACCESS)) +
        4096 / sizeof(VARIANT);
    VirtualAlloc(end - 1, sizeof *end, MEM_COMMIT, PAGE_READWRITE);
    end[-1] = Value(VT_I4, 1);
    DISPPARAMS last = {end - 1, nullptr, 1, 0};
    Answers("Invoke at the end of readable memory",
            {tarn->Invoke(7, IID_NULL, 0, DISPATCH_METHOD, &last, nullptr, nullptr, nullptr)});
    Answers("Invoke", {invoke(7, IID_IUnknown), invoke(-4, IID_NULL), invoke(1999, IID_NULL)});
    UINT count = 99;
    ITypeInfo* type = nullptr;
    void** slots = *reinterpret_cast<void***>(tarn);
    const auto supports = reinterpret_cast<HRESULT(__stdcall*)(void*, const IID&)>(slots[7]);
    const auto fakeError = reinterpret_cast<HRESULT(__stdcall*)(void*)>(slots[9]);
    Answers("tarn",
            {tarn->QueryInterface(IID_IUnknown, nullptr), tarn->GetTypeInfoCount(&count),
             tarn->GetTypeInfo(0, 0, &type), supports(tarn, IID_IDispatch), fakeError(tarn)});
    EXPECT_TRUE(count == 99 && !type) << "written";
    IErrorInfo* error = nullptr;
    BSTR source = nullptr, text = nullptr;
    ASSERT_EQ(S_OK, GetErrorInfo(0, &error));
    Answers("the fake error", {error->GetSource(&source), error->GetDescription(&text)});
    EXPECT_EQ(L"COM: This is a fake error generated by the component.", source + L": "s + text);
    SetErrorInfo(0, error);
    Call(L"f");
    IErrorInfo* cleared = nullptr;
    EXPECT_EQ(S_FALSE, GetErrorInfo(0, &cleared)) << "a call clears the thread's error";
    // What the host sets during a call stays, and a refused call changes nothing.
    on["call 7"] = [&] { SetErrorInfo(0, error); };
    Call(L"f");
    on.erase("call 7");
    EXPECT_EQ(S_OK, GetErrorInfo(0, &cleared)) << "the host's error";
    SetErrorInfo(0, cleared), cleared->Release();
    invoke(7, IID_IUnknown), invoke(-4, IID_NULL);
    EXPECT_EQ(S_OK, GetErrorInfo(0, &cleared)) << "after a refused call";
    cleared->Release();
    EXPECT_EQ(0u, error->Release()) << "a reference is left";
    SysFreeString(source), SysFreeString(text);
    EXPECT_TRUE(tarn->Release() == 0 && tarn->AddRef() == 1) << "still usable";
  });
}

namespace {
// Fails when it has no text of its line.
struct FakeError {
  void** table;
  const wchar_t* text;
  LONG line, column;
  BSTR description;
};
HRESULT __stdcall GetExceptionInfo(FakeError* error, EXCEPINFO* info) {
  return info->bstrDescription = error->description, S_OK;
}
HRESULT __stdcall GetSourcePosition(FakeError* error, DWORD*, LONG* line, LONG* column) {
  return error->text ? *line = error->line, *column = error->column, S_OK : E_FAIL;
}
HRESULT __stdcall GetSourceLineText(FakeError* error, BSTR* text) {
  return error->text ? *text = SysAllocString(error->text), S_OK : E_FAIL;
}
}  // namespace

TEST_F(DispatchTest, TheSite) {
  Script([] {
    IActiveScriptSiteWindow* window = nullptr;
    void* object = nullptr;
    HWND handle = nullptr;
    site->QueryInterface(IID_IActiveScriptSiteWindow, reinterpret_cast<void**>(&window));
    Answers("the site",
            {window->QueryInterface(IID_IUnknown, &object),
             site->QueryInterface(IID_IDispatch, &object),
             window->QueryInterface(IID_IUnknown, nullptr), window->GetWindow(&handle),
             window->GetWindow(nullptr), window->EnableModeless(TRUE), site->GetLCID(nullptr),
             site->GetDocVersionString(nullptr), site->OnScriptTerminate(nullptr, nullptr),
             site->OnStateChange(SCRIPTSTATE_CONNECTED), site->OnEnterScript(),
             site->OnLeaveScript(), site->OnScriptError(nullptr),
             site->GetItemInfo(L"tarn", SCRIPTINFO_IUNKNOWN, nullptr, nullptr),
             site->GetItemInfo(L"tarn", SCRIPTINFO_ITYPEINFO, nullptr, nullptr)});
    EXPECT_TRUE(object == site && handle == reinterpret_cast<HWND>(0x1234));
    for (IUnknown* each : {static_cast<IUnknown*>(site), static_cast<IUnknown*>(window)})
      EXPECT_EQ(3u, each->AddRef() + each->Release() + each->Release());
    for (const wchar_t* name : {L"tarn", L"Tarn", L"tarn2", static_cast<const wchar_t*>(nullptr)})
      for (DWORD mask = 0; mask <= SCRIPTINFO_ALL_FLAGS; ++mask) {
        IUnknown* item = site;
        ITypeInfo* type = reinterpret_cast<ITypeInfo*>(site);
        Answers("GetItemInfo", {site->GetItemInfo(name, mask, &item, &type)});
        Log("  item " + State(item, site) + ", type " + State(type, site));
      }
    auto table =
        Table(Unused, Unused, Unused, GetExceptionInfo, GetSourcePosition, GetSourceLineText);
    const std::wstring y600(600, 'y');
    FakeError errors[] = {{table.data(), L"x = = 1", 4, 7, nullptr},
                          {table.data(), nullptr, 0, 0, nullptr},
                          {table.data(), y600.c_str(), 0, -3, SysAllocString(L"no t\u00F6kens")}};
    for (FakeError& error : errors)
      site->OnScriptError(reinterpret_cast<IActiveScriptError*>(&error));
    EXPECT_STREQ(L"no t\u00F6kens", errors[2].description) << "the engine's own text";
  });
}
