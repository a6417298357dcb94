// SPDX-License-Identifier: MIT
#include <filesystem>
#include <fstream>
#include <sstream>

#include "TestSupport.h"
#include "cLib/cCompat.h"
#include "cLib/cReport.h"
#include "cLib/cStop.h"

class Reporter : public CoreTest {
 protected:
  Reporter() { TakeLog(), SetLogFile(path.c_str()); }
  ~Reporter() override { SetLogFile(nullptr), TakeLog(); }
  Text TakeLog() const {
    std::stringstream text;
    text << std::ifstream(path).rdbuf();
    std::filesystem::remove(path);
    return text.str();
  }
  // Tests may run at the same time.
  const Text path = testing::TempDir() + "core-" + std::to_string(std::random_device()()) + ".log";
};

TEST_F(Reporter, WritesTheLogLineAndTheHookLine) {
  const std::tuple<const char*, int, const char*, int, const char*, const char*> cases[] = {
      {"x", 7, "boom", 2, "[*] ASSERT    \"x\" (7)       >> boom\n", "\"x\" (7)      boom\n"},
      {"x", 12345, "", 1, "[*] TRACE     \"x\" (12345)   >> \n", "\"x\" (12345)  \n"},
      {"x", 123456, "b", 4, "[*] EXCEPTION \"x\" (123456)  >> b\n", "\"x\" (123456) b\n"},
      {"x", 1234567, "b", 3, "[*] VERIFY    \"x\" (1234567)  >> b\n", "\"x\" (1234567) b\n"},
      {"x", 1, "b", 5, "[*] TIMESTAMP \"x\" (1)       >> * - b\n", "\"x\" (1)      * - b\n"},
      {"x", 1, "b\n", 6, "[*] RUNTIME   \"x\" (1)       >> b\n", ""},
      {"x", 1, nullptr, 9, "[*] UNKNOWN \"x\" (1)       >> \n", "\"x\" (1)      \n"},
      {nullptr, 10, "b", 0, "[*] >> b\n", "\"\" (10)     b\n"},
  };
  for (const auto& [file, line, text, level, logLine, hookLine] : cases) {
    EXPECT_EQ(Report(file, line, text, level), 0);
    Text seen = TakeLog();
    for (const Text& report : std::exchange(reports, {})) seen += report;
    const Text now = seen.substr(1, 24);
    for (size_t at; (at = seen.find(now)) != Text::npos;) seen.replace(at, 24, "*");
    EXPECT_EQ(seen, Text(logLine) + hookLine);
  }
  Report("x", 1, Text(10000, 'y').c_str(), kReportTrace);
  EXPECT_TRUE(TakeLog().size() == 8192 && reports.back().size() == 8191);
}

TEST_F(Reporter, WritesToTheLogFileAndNeverCallsTheHookFromWithin) {
  SetDebugHook([](const char*) { EXPECT_EQ(Report("x", 2, "inner", kReportAssert), 1); });
  EXPECT_EQ(Report("x", 1, "outer", kReportAssert), 0);
  EXPECT_NE(TakeLog().find("inner"), Text::npos);
  WriteLogLine("a"), WriteLogLine("b\n"), WriteLogLine(""), WriteLogLine(nullptr);
  for (const char* other : {"", "no-such-folder/x.log"}) SetLogFile(other), WriteLogLine("c");
  EXPECT_EQ(TakeLog(), "a\nb\n\n\n");
  Text longPath = testing::TempDir();
  while (longPath.size() < 230) longPath += "./";
  longPath.resize(300, 'a');
  SetLogFile(longPath.c_str()), WriteLogLine("x");
  EXPECT_TRUE(std::filesystem::remove(longPath.substr(0, 255)));
  testing::internal::CaptureStdout();
  WriteStdout("a\n%s"), WriteStdout(nullptr);
#if defined(_WIN32)
  EXPECT_EQ(_lseek(1, 0, SEEK_CUR), 4) << "the bytes as they are";
  EXPECT_EQ(_setmode(1, _O_TEXT), _O_TEXT) << "as it was";
#endif
  EXPECT_EQ(testing::internal::GetCapturedStdout(), "a\n%s");
}

TEST_F(Reporter, ReportsAStopWithoutARunAndJumpsWithItsValue) {
  StopMacro();
  EXPECT_EQ(TakeReports("Stop without a run to stop"), 1);
  const int value = setjmp(CurrentStopPoint().buffer);
  if (value == 0) {
    CurrentStopPoint().thread = CurrentThread(), CurrentStopPoint().armed = true;
    StopMacro();
  }
  CurrentStopPoint().armed = false;
  EXPECT_EQ(value, -1);
}
