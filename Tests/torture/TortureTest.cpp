// SPDX-License-Identifier: MIT
#include "TortureTest.h"

#include <cstdarg>
#include <cstdio>

void Figure(const char* format, ...) {
  va_list arguments;
  va_start(arguments, format);
  std::printf("figure: ");
  std::vprintf(format, arguments);
  std::printf("\n");
  va_end(arguments);
}

TortureTest::TortureTest(const std::string& description, const std::string& macro)
    : rightDescription(description), rightMacro(macro) {
  const char* given = std::getenv("SCRIPTRUBY_TORTURE_SEED");
  const unsigned seed = given ? std::strtoul(given, nullptr, 10) : std::random_device()();
  std::printf("SCRIPTRUBY_TORTURE_SEED=%u\n", seed);
  std::fflush(stdout);
  random.seed(seed);
  muted = true;
  right = RightRun();
  EXPECT_NE(std::string::npos, right.find("execute returned 1,")) << right;
  on = {{"report: Tarn has", [] { ADD_FAILURE() << "a fault"; }}};
}

void TortureTest::TearDown() {
  EXPECT_TRUE(host.IsClean());
  EXPECT_FALSE(Kill(1)) << "a host is still current";
  ExpectRightRun();
}

int TortureTest::Rounds(int whole, int part) {
  return std::getenv("SCRIPTRUBY_TORTURE") ? whole : part;
}

std::string TortureTest::RightRun() {
  Describe(rightDescription), WriteBytes(macroPath, rightMacro);
  const auto planned = std::exchange(on, {});
  on["engine: SetScriptState 2"] = [] { Call(L"f", {Value(VT_I4, 1)}); };
  on["call 7"] = [this] { host.AnswerTexts({"text"}); };
  muted = false;
  transcript.clear();
  Run();
  muted = true;
  on = planned;
  return std::exchange(transcript, "");
}

void TortureTest::ExpectRightRun() { ASSERT_EQ(right, RightRun()); }

void TortureTest::Repeat(const char* what, int rounds, int often,
                         const std::function<void(int)>& round) {
  Resources early = {};
  for (int i = 0; i < rounds && !HasFatalFailure(); ++i) {
    SCOPED_TRACE("round " + std::to_string(i));
    round(i);
    if (i % often == 0) ExpectRightRun();
    if (i == rounds / 10) early = Used();
  }
  const Resources late = Used();
  Figure("%d %s: %u KiB and %u handles after a tenth, %u KiB and %u handles at the end", rounds,
         what, early.kilobytes, early.handles, late.kilobytes, late.handles);
  EXPECT_LE(late.handles, early.handles + kOwnHandles) << what;
  // A short test ends while the heaps still find their size.
  const unsigned more = Rounds(0, 512);
  EXPECT_LE(late.kilobytes, early.kilobytes + early.kilobytes / 100 + more) << what;
}

std::string TortureTest::Bytes(size_t longest) {
  std::string bytes(OneIn(8) ? Below(longest + 1) : Below(std::min<size_t>(longest, 12) + 1), 0);
  for (char& byte : bytes) byte = static_cast<char>(1 + Below(255));
  return bytes;
}
