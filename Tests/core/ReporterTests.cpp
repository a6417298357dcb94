// SPDX-License-Identifier: MIT
#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <sstream>

#include "TestSupport.h"
#include "cLib/cReport.h"

class Reporter : public testing::Test {
 protected:
  Reporter() { SetLogFile(path.c_str()); }
  ~Reporter() override {
    SetLogFile(nullptr);
    std::filesystem::remove(path);
  }
  std::string Log() const {
    std::stringstream text;
    text << std::ifstream(path).rdbuf();
    return text.str();
  }

  Reports reports;
  std::string path = testing::TempDir() + "core-report.log";
};

TEST_F(Reporter, WritesTheLogLineAndTheHookLine) {
  const struct {
    const char* file;
    int line;
    const char* text;
    int level;
    std::string log, hook;
  } cases[] = {
      {"x", 7, "boom", 2, "[*] ASSERT    \"x\" (7)       >> boom\n", "\"x\" (7)      boom\n"},
      {"x", 12345, "", 1, "[*] TRACE     \"x\" (12345)   >> \n", "\"x\" (12345)  \n"},
      {"x", 1234567, "b", 3, "[*] VERIFY    \"x\" (1234567)  >> b\n", "\"x\" (1234567) b\n"},
      {"x", 123456, "b", 4, "[*] EXCEPTION \"x\" (123456)  >> b\n", "\"x\" (123456) b\n"},
      {"x", 1, "start", 5, "[*] TIMESTAMP \"x\" (1)       >> * - start\n",
       "\"x\" (1)      * - start\n"},
      {"x", 1, nullptr, 5, "[*] TIMESTAMP \"x\" (1)       >> *\n", "\"x\" (1)      *\n"},
      {"x", 1, "b\n", 6, "[*] RUNTIME   \"x\" (1)       >> b\n", ""},
      {"x", 1, "b", 9, "[*] UNKNOWN \"x\" (1)       >> b\n", "\"x\" (1)      b\n"},
      {nullptr, 10, "b", 2, "[*] >> b\n", "\"\" (10)     b\n"},
      {"x", 1, nullptr, 0, "[*] UNKNOWN \"x\" (1)       >> \n", "\"x\" (1)      \n"},
  };
  for (const auto& test : cases) {
    EXPECT_EQ(Report(test.file, test.line, test.text, test.level), 0);
    std::string log = Log(), hook = reports.Lines().empty() ? "" : reports.Lines().back();
    ASSERT_EQ(log.find(']'), 25u) << log;
    const std::string now = log.substr(1, 24);
    for (std::string* text : {&log, &hook})
      for (size_t at; (at = text->find(now)) != std::string::npos;) text->replace(at, 24, "*");
    EXPECT_EQ(log, test.log);
    EXPECT_EQ(hook, test.hook);
    reports.Take();
    std::filesystem::remove(path);
  }
}

TEST_F(Reporter, CutsLongLines) {
  Report("x", 1, std::string(10000, 'y').c_str(), kReportTrace);
  EXPECT_EQ(Log().size(), 8192u);
  EXPECT_EQ(reports.Lines().at(0).size(), 8191u);
}

TEST_F(Reporter, DoesNotCallTheHookFromWithinItself) {
  static int depth;
  static int calls;
  calls = 0;
  const DebugHook previous = SetDebugHook([](const char*) {
    ++calls;
    depth = Report("x", 2, "inner", kReportAssert);
  });
  EXPECT_EQ(Report("x", 1, "outer", kReportAssert), 0);
  EXPECT_EQ(depth, 1);
  EXPECT_EQ(calls, 1);
  EXPECT_NE(Log().find("inner"), std::string::npos);
  SetDebugHook(previous);
  Report("x", 3, "after", kReportAssert);
  EXPECT_EQ(reports.Take("after"), 1);
}

TEST_F(Reporter, AppendsLogLines) {
  for (const char* line : {"a", "b\n", "", No()}) WriteLogLine(line);
  EXPECT_EQ(Log(), "a\nb\n\n\n");
  SetLogFile("");
  WriteLogLine("c");
  SetLogFile((testing::TempDir() + "no-such-folder/x.log").c_str());
  WriteLogLine("c");
  EXPECT_EQ(Log(), "a\nb\n\n\n");
}

TEST_F(Reporter, CutsALongPath) {
  std::string longPath = testing::TempDir();
  while (longPath.size() < 230) longPath += "./";
  longPath.resize(300, 'a');
  SetLogFile(longPath.c_str());
  WriteLogLine("x");
  EXPECT_TRUE(std::filesystem::remove(longPath.substr(0, 255)));
}

TEST_F(Reporter, WritesStandardOutputUnchanged) {
  testing::internal::CaptureStdout();
  WriteStdout("a\n%s");
  WriteStdout(nullptr);
  EXPECT_EQ(testing::internal::GetCapturedStdout(), "a\n%s");
}
