// SPDX-License-Identifier: MIT
// What passes between a macro and the host's objects: values, texts, calls and their errors.
#include <math.h>

#include <algorithm>

#include "EngineHost.h"

static Item::Function Answers(const VARIANT& value) {
  return [value](Item::Call call) {
    if (call.result) *call.result = value;
    return S_OK;
  };
}

static VARIANT Decimal(BYTE scale, BYTE sign, ULONG high, ULONGLONG low) {
  VARIANT value = {};
  value.decVal = {0, {{scale, sign}}, high, {}};
  value.decVal.Lo64 = low;
  value.vt = VT_DECIMAL;
  return value;
}

// Of the type, with the bounds; elements count up from 1.
template <class T>
static VARIANT Array(VARTYPE type, std::vector<SAFEARRAYBOUND> bounds) {
  SAFEARRAY* const array = SafeArrayCreate(type, static_cast<UINT>(bounds.size()), bounds.data());
  ULONG count = 1;
  for (const SAFEARRAYBOUND& bound : bounds) count *= bound.cElements;
  for (ULONG i = 0; i < count; ++i) static_cast<T*>(array->pvData)[i] = static_cast<T>(i + 1);
  return Value(static_cast<VARTYPE>(VT_ARRAY | type), array);
}

static VARIANT Vector(std::vector<VARIANT> elements) {
  SAFEARRAY* const array =
      SafeArrayCreateVector(VT_VARIANT, 1, static_cast<ULONG>(elements.size()));
  memcpy(array->pvData, elements.data(), elements.size() * sizeof(VARIANT));
  return Value(VT_ARRAY | VT_VARIANT, array);
}

TEST(Values, ToTheHost) {
  Host host;
  host.item.Add("f");
  host.item.Add(
      "echo", [](Item::Call call) { return VariantCopy(call.result, &call.arguments->rgvarg[0]); });
  CheckTranscript("values.txt", [&](const std::string& macro) { return host.Run(macro); });
  // An object is the same one on its way out and back.
  host.item.Add("same", [&](Item::Call call) {
    EXPECT_EQ(&host.item, call.arguments->rgvarg[0].pdispVal);
    return VariantCopy(call.result, &call.arguments->rgvarg[0]);
  });
  EXPECT_EQ("true", host.Inspect("[@item.same(@item), @item.same(1, 'x', @item)].all?(@item)"));
}

TEST(Values, FromTheHost) {
  Host host;
  LONG number = 7;
  double real = 2.5;
  CY money = {};
  money.int64 = -15000;
  BSTR text = SysAllocString(L"by reference");
  VARIANT_BOOL yes = VARIANT_TRUE;
  VARIANT decimal = Decimal(1, 0, 0, 15), inner = Text(L"inner"), null = Value(VT_NULL, 0);
  SAFEARRAY* array = Array<LONG>(VT_I4, {{2, 0}}).parray;
  IDispatch* object = &host.item;
  // clang-format off
  const std::pair<VARIANT, const char*> values[] = {
      {Value(VT_EMPTY, 0), "nil"}, {Value(VT_NULL, 0), "nil"},
      {Value(VT_I1, -1), "-1"}, {Value(VT_UI1, 255), "255"}, {Value(VT_I2, -2), "-2"},
      {Value(VT_UI2, 65535), "65535"}, {Value(VT_I4, -3), "-3"}, {Value(VT_UI4, -1), "4294967295"},
      {Value(VT_INT, -4), "-4"}, {Value(VT_UINT, -1), "4294967295"},
      {Value(VT_I8, INT64_MIN), "-9223372036854775808"},
      {Value(VT_UI8, UINT64_MAX), "18446744073709551615"},
      {Value(VT_R4, 1.5f), "1.5"}, {Value(VT_R8, 0.1), "0.1"}, {Value(VT_BOOL, -1), "true"},
      {Value(VT_BOOL, 0), "false"}, {Value(VT_CY, 10000ll), "1"},
      {Value(VT_CY, 12345ll), "(2469/2000)"},
      {Value(VT_CY, INT64_MIN), "(-576460752303423488/625)"},
      {Decimal(0, 0, 0, 42), "42"}, {Decimal(2, DECIMAL_NEG, 0, 150), "(-3/2)"},
      {Decimal(0, 0, 0xFFFFFFFF, UINT64_MAX), "79228162514264337593543950335"},
      {Decimal(28, 0, 0, 1), "(1/10000000000000000000000000000)"},
      {Value(VT_ERROR, DISP_E_PARAMNOTFOUND), "nil"}, {Value(VT_ERROR, E_FAIL), "-2147467259"},
      {Text(L""), "\"\""}, {Value(VT_BSTR, 0ll), "\"\""}, {Text(L"a\0b"s), "\"a\\u0000b\""},
      {Text(L"\u00FC\u00DF \u65E5\U0001F600"), "\"\xC3\xBC\xC3\x9F \xE6\x97\xA5\xF0\x9F\x98\x80\""},
      {Value(VT_DISPATCH, 0ll), "nil"}, {Value(VT_UNKNOWN, 0ll), "nil"},
      {Array<LONG>(VT_I4, {{3, -1}}), "[1, 2, 3]"}, {Array<BYTE>(VT_UI1, {{2, 0}}), "[1, 2]"},
      {Array<double>(VT_R8, {{2, 5}}), "[1.0, 2.0]"}, {Array<LONG>(VT_I4, {{0, 0}}), "[]"},
      {Array<short>(VT_I2, {{2, 0}, {3, 1}}), "[[1, 3, 5], [2, 4, 6]]"},
      {Value(VT_ARRAY | VT_I4, 0ll), "[]"},
      {Vector({Text(L"a"), Value(VT_NULL, 0), Vector({Value(VT_I4, 1), Decimal(1, 0, 0, 5)})}),
       "[\"a\", nil, [1, (1/2)]]"},
      {Value(VT_BYREF | VT_I4, &number), "7"}, {Value(VT_BYREF | VT_R8, &real), "2.5"},
      {Value(VT_BYREF | VT_CY, &money), "(-3/2)"},
      {Value(VT_BYREF | VT_BSTR, &text), "\"by reference\""},
      {Value(VT_BYREF | VT_BOOL, &yes), "true"}, {Value(VT_BYREF | VT_DECIMAL, &decimal), "(3/2)"},
      {Value(VT_BYREF | VT_VARIANT, &inner), "\"inner\""},
      {Value(VT_BYREF | VT_VARIANT, &null), "nil"}, {Value(VT_BYREF | VT_ARRAY | VT_I4, &array), "[1, 2]"},
      {Value(VT_BYREF | VT_DISPATCH, &object), "#<ActiveScript::ComObject>"},
      {Value(VT_RECORD, 0ll),
       "error: value of type 36 from a COM object has no Ruby form (TypeError)"},
      {Value(VT_BYREF | VT_I4, 0ll), "error: null reference from a COM object (TypeError)"}};
  // clang-format on
  for (const auto& [value, inspected] : values) {
    host.item.Add("value", Answers(value));
    EXPECT_EQ(inspected, host.Inspect("@item.value")) << Hex(value.vt);
    EXPECT_EQ(1u, host.item.references) << Hex(value.vt);
  }
  VariantClear(&inner), SysFreeString(text), SafeArrayDestroy(array);

  const std::pair<double, const char*> dates[] = {{0, "1899-12-30 00:00:00"},
                                                  {-1.25, "1899-12-29 06:00:00"},
                                                  {0.75, "1899-12-30 18:00:00"},
                                                  {36526.5, "2000-01-01 12:00:00"},
                                                  {45000.999988425926, "2023-03-15 23:59:59"},
                                                  {-657434, "0100-01-01 00:00:00"},
                                                  {2958465, "9999-12-31 00:00:00"}};
  for (const auto& [days, shown] : dates) {
    host.item.Add("value", Answers(Value(VT_DATE, days)));
    EXPECT_EQ("\""s + shown + "\"", host.Inspect("@item.value.strftime('%Y-%m-%d %H:%M:%S')"));
    host.item.Add("back", [&](Item::Call call) {
      EXPECT_NEAR(days, call.arguments->rgvarg[0].date, 1e-8);
      return S_OK;
    });
    EXPECT_EQ("nil", host.Inspect("@item.back(@item.value)"));
  }
  for (int i = 1; i < 1000; i += 37) {
    host.item.Add("value", Answers(Value(VT_DATE, 45000 + (43200 + i / 1000.0) / 86400)));
    EXPECT_EQ(std::to_string(i), host.Inspect("@item.value.strftime('%L').to_i"));
  }
  host.item.Add("value", Answers(Value(VT_DATE, HUGE_VAL)));
  EXPECT_EQ("error: ", host.Inspect("@item.value").substr(0, 7));
  // An object of another kind is asked for what it has.
  host.item.AddRef();
  host.item.Add("value", Answers(Value(VT_UNKNOWN, static_cast<IUnknown*>(&host.item))));
  EXPECT_EQ("true", host.Inspect("@item.value == @item"));
  host.AddRef();
  host.item.Add("value", Answers(Value(VT_UNKNOWN, static_cast<IActiveScriptSite*>(&host))));
  EXPECT_EQ("error: value of type 13 from a COM object has no Ruby form (TypeError)",
            host.Inspect("@item.value"));
}

// An 8-bit host gets bytes, and widens what it answers in the ANSI code page.
TEST(Values, TextsOfAByteHost) {
  Host host("tarn"), wide;
  host.item.Add("f");
  host.item.Add("message");
  host.item.Add("echo", [](Item::Call call) {
    const BSTR text = call.arguments->rgvarg[0].bstrVal;
    std::string bytes;
    for (UINT i = 0; i < SysStringLen(text); ++i) bytes += static_cast<char>(text[i]);
    const int size = static_cast<int>(bytes.size());
    std::wstring answer(bytes.size(), 0);
    answer.resize(MultiByteToWideChar(CP_ACP, 0, bytes.data(), size, answer.data(), size));
    *call.result = Text(answer);
    return S_OK;
  });
  CheckTranscript("bytes.txt", [&](const std::string& macro) { return host.Run(macro); });
  // A byte-order mark before the source; and a source that no 8-bit host can have widened.
  EXPECT_EQ("tarn.f('\\xC3\\xA4')", host.Run("\xEF\xBB\xBF@tarn.f '\xC3\xA4'"));
  EXPECT_EQ("", wide.Run("\xEF\xBB\xBF# x\nraise 'mark' unless __LINE__ == 2"));
  host.Open();
  host.parse->ParseScriptText(L"@tarn.f('\u65E5\u00E4')", nullptr, nullptr, nullptr, 0, 0, 0,
                              nullptr, nullptr);
  host.Start();
  EXPECT_EQ("tarn.f('\\u65E5\\xE4')", TakeLog());
  host.Close();
}

static HRESULT WINAPI FillIn(EXCEPINFO* exception) {
  exception->scode = E_FAIL;
  exception->bstrDescription = SysAllocString(L"later");
  return S_OK;
}

TEST(Values, ObjectsOfTheHost) {
  Host host;
  for (const char* name : {"f", "text", "Cell", "[]",
                           "gr\\xF6\\xDF"
                           "e"})
    host.item.Add(name, Answers(Value(VT_I4, 5)));
  const auto fails = [&](HRESULT result, HRESULT code = 0, const wchar_t* text = nullptr) {
    return [=](Item::Call call) {
      call.exception->scode = code;
      call.exception->bstrDescription = SysAllocString(text);
      call.exception->bstrSource = text ? SysAllocString(L"Source") : nullptr;
      return result;
    };
  };
  host.item.Add("explained", fails(DISP_E_EXCEPTION, 0x80041234, L"It went wr\u00F6ng."));
  host.item.Add("unexplained", fails(E_ACCESSDENIED));
  host.item.Add("coded", fails(DISP_E_EXCEPTION, E_OUTOFMEMORY));
  host.item.Add("deferred", [](Item::Call call) {
    call.exception->pfnDeferredFillIn = FillIn;
    return DISP_E_EXCEPTION;
  });
  host.item.Add("helped", [](Item::Call call) {
    *call.exception = {};
    call.exception->wCode = 1001;
    call.exception->bstrHelpFile = SysAllocString(L"help.chm");
    call.exception->dwHelpContext = 42;
    return DISP_E_EXCEPTION;
  });
  CheckTranscript("objects.txt", [&](const std::string& macro) { return host.Run(macro); });
  // What the failed call has said goes on to the site, unless the macro rescues it.
  const auto error = [&](const char* macro) {
    host.Run(macro);
    return Hex(host.error.code) + " " + std::to_string(host.error.wCode) + " " + host.error.help;
  };
  EXPECT_EQ("80020009 1001 help.chm:42", error("@item.helped"));
  EXPECT_EQ("80041234 0 :0", error("@item.explained"));
  EXPECT_EQ("80070005 0 :0", error("@item.unexplained"));
  EXPECT_EQ("80004005 0 :0",
            error("raise ActiveScript::ComError.new('x', :y, 0, nil, [], [], {})"));
  TakeLog();
  // Collected objects are given back while the macro runs, not only at its end.
  ULONG most = 0;
  host.item.quiet = true;
  host.item.Add("child", [&](Item::Call call) {
    most = std::max(most, host.item.references);
    host.item.AddRef();
    return *call.result = Value(VT_DISPATCH, static_cast<IDispatch*>(&host.item)), S_OK;
  });
  EXPECT_EQ("", host.Run("100.times { 100.times { @item.child }; GC.start; @item.f }"));
  EXPECT_LT(most, 5000u);
}
