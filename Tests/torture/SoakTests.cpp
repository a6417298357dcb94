// SPDX-License-Identifier: MIT
// Long use: the process holds as much at the end as after a tenth.
#include "TortureTest.h"

constexpr int kCalls = 100;  // of a run

class SoakTest : public TortureTest {};

// With the engine of the tests, which leaves all that grows to the module.
TEST_F(SoakTest, OfTheModule) {
  on["engine: SetScriptState 2"] = [] {
    IDispatch* const tarn = Item();
    VARIANT arguments[] = {Value(VT_R8, 2.5), Value(VT_I4, 1),
                           Value(VT_BSTR, SysAllocString(L"text"))};
    DISPPARAMS params = {arguments, nullptr, 3, 0};
    for (int i = 0; i < kCalls; ++i) {
      VARIANT result = {};
      EXPECT_EQ(S_OK,
                tarn->Invoke(7, IID_NULL, 0, DISPATCH_METHOD, &params, &result, nullptr, nullptr));
      EXPECT_EQ(VT_BSTR, result.vt);
      VariantClear(&result);
    }
    VariantClear(&arguments[2]);
  };
  on["call 7"] = [&] { host.AnswerTexts({"text"}); };
  Repeat("runs of 100 calls", Rounds(100000, 300), 1000, [&](int) { ASSERT_EQ(1, Run()); });
}

class RubySoakTest : public TortureTest {
 protected:
  RubySoakTest()
      : TortureTest((ActivateRuby(), ""), "100.times { |i| @tarn.f('text', i, 2.5) }\n") {}
};

TEST_F(RubySoakTest, OfTheEngine) {
  int calls = 0;
  on["call 7"] = [&] { ++calls, host.AnswerTexts({"text"}); };
  const int runs = Rounds(100000, 300);
  Repeat("runs of 100 calls from Ruby", runs, 1000, [&](int) { ASSERT_EQ(1, Run()); });
  EXPECT_EQ(kCalls * runs, calls);
}
