// SPDX-License-Identifier: MIT
// Random calls of `tarn`, as an engine may make them: what arrives at the host and what returns to the
// script is right, and the values stay the engine's.
#include <list>

#include "RandomValue.h"
#include "TortureTest.h"

class RandomCallTest : public TortureTest {
 protected:
  RandomCallTest() {
    on["call "] = [this] { Answer(); };
    // The value of an object may be the script's own code, which calls in turn.
    RandomValue::onAsked = [this] {
      DISPPARAMS none = {};
      if (OneIn(4)) tarn->Invoke(0, IID_NULL, 0, DISPATCH_METHOD, &none, nullptr, nullptr, nullptr);
    };
  }
  ~RandomCallTest() override {
    RandomValue::onAsked = nullptr;
    EXPECT_EQ(0, RandomValue::objectReferences);
  }

  // The host's half of a call.
  void Answer() {
    const int count = At<int>(host.context, 51 + 8);
    void** const list = At<void**>(host.context, 51 + 16);
    arrived = count == static_cast<int>(expected.size());
    for (int i = 0; arrived && i < count; ++i) arrived = expected[i]->Is(list[i]);
    texts.assign(OneIn(3) ? Below(4) : 0, "");
    for (std::string& text : texts) text = Bytes(1000);
    host.AnswerTexts(texts, kind = OneIn(4) ? random() : 1);
    At<unsigned>(host.context, 27) = integer = random();
  }

  void CheckResult(const VARIANT& result, const VARIANT& before) const {
    if (texts.empty()) {
      EXPECT_TRUE(result.vt == VT_I4 && result.ulVal == integer);
    } else if (kind == 1) {
      wchar_t wide[1001] = {};
      MultiByteToWideChar(CP_ACP, 0, texts[0].c_str(), -1, wide, 1001);
      ASSERT_EQ(VT_BSTR, result.vt);
      EXPECT_STREQ(wide, result.bstrVal);
      SysFreeString(result.bstrVal);
    } else {
      EXPECT_EQ(0, memcmp(&before, &result, sizeof result)) << "untouched";
    }
  }

  void CallOnce() {
    std::list<RandomValue> values;
    for (unsigned i = OneIn(50) ? Below(300) : Below(6); i > 0; --i) values.emplace_back(random);
    std::vector<VARIANT> arguments;
    for (const RandomValue& each : values) arguments.insert(arguments.begin(), each.value);
    std::vector<VARIANT> before = arguments;
    DISPID names[300] = {DISPID_PROPERTYPUT};
    DISPPARAMS params = {arguments.data(), names, static_cast<UINT>(arguments.size()),
                         OneIn(8) ? Below(arguments.size() + 1) : 0};
    if (OneIn(32)) params.rgvarg = nullptr;
    const bool given = !OneIn(32);
    expected.clear();
    for (const RandomValue& each : values)
      if (each.Passes() && params.rgvarg && given) expected.push_back(&each);

    const IID& riid = OneIn(64) ? IID_IUnknown : IID_NULL;
    const DISPID id = OneIn(8) ? static_cast<DISPID>(random()) : 7;
    VARIANT result;
    for (unsigned short& bits : reinterpret_cast<unsigned short(&)[8]>(result)) bits = random();
    const VARIANT resultBefore = result;
    const bool wantsResult = !OneIn(8);
    EXCEPINFO exception = {};
    UINT wrong = 0;
    const int references = RandomValue::objectReferences;
    arrived = false;
    const HRESULT outcome =
        tarn->Invoke(id, riid, random(), static_cast<WORD>(random()), given ? &params : nullptr,
                     wantsResult ? &result : nullptr, OneIn(2) ? &exception : nullptr,
                     OneIn(2) ? &wrong : nullptr);
    const bool valid = &riid == &IID_NULL && id >= 0;
    EXPECT_EQ(valid ? S_OK : DISP_E_UNKNOWNINTERFACE, outcome);
    EXPECT_EQ(valid, arrived);
    EXPECT_EQ(references, RandomValue::objectReferences);
    const size_t bytes = arguments.size() * sizeof(VARIANT);
    EXPECT_TRUE(bytes == 0 || memcmp(before.data(), arguments.data(), bytes) == 0);
    if (valid && wantsResult) CheckResult(result, resultBefore);
  }

  IDispatch* tarn = nullptr;
  std::vector<const RandomValue*> expected;
  bool arrived = false;
  // The host's answer.
  std::vector<std::string> texts;
  unsigned kind = 1, integer = 0;
};

TEST_F(RandomCallTest, ArriveAndAnswer) {
  constexpr int kCalls = 1000;  // of a run
  on["engine: SetScriptState 2"] = [&] {
    tarn = Item();
    for (int i = 0; i < kCalls && !HasFailure(); ++i) CallOnce();
  };
  Repeat("runs of 1,000 random calls", Rounds(5000, 150), 10, [&](int) { ASSERT_EQ(1, Run()); });
}
