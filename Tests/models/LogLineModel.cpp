// SPDX-License-Identifier: MIT
// Reports of any length: the line of the hook and the line of the log.
#include <unistd.h>

#include <fstream>
#include <iterator>

#include "Model.h"
#include "cLib/cReport.h"

static constexpr size_t kLongestLine = 8191;
static std::string hooked;

static std::string TakeLogged(const std::string& path) {
  std::ifstream file(path, std::ios::binary);
  std::string text(std::istreambuf_iterator<char>(file), {});
  file.close();
  unlink(path.c_str());
  return text;
}

size_t LogLineModel(Input& input) {
  static const std::string path = "/tmp/fuzz-log-" + std::to_string(getpid());
  SetLogFile(path.c_str());
  SetDebugHook([](const char* line) { hooked = line; });
  const std::string file = AnyBytes(input, 300);
  const int line = input.ConsumeIntegral<int>(), level = static_cast<int>(Below(input, 10)) - 1;
  std::string text = AnyBytes(input, 1000);
  for (u32 doublings = Below(input, 6); doublings > 0; --doublings) text += text;

  hooked.clear();
  CHECK(Report(input.ConsumeBool() ? nullptr : file.c_str(), line, text.c_str(), level) == 0);
  CHECK(hooked.empty() == (level == kReportRuntime));
  const std::string logged = TakeLogged(path), number = "(" + std::to_string(line) + ")";
  CHECK(logged.starts_with("[") && logged.ends_with("\n"));
  CHECK(logged.size() <= kLongestLine + 1 && hooked.size() <= kLongestLine);
  if (!hooked.empty()) CHECK(hooked.starts_with("\"") && hooked.find(number) != std::string::npos);
  if (level != kReportTimestamp && logged.size() < kLongestLine) {
    CHECK(logged.ends_with(text.ends_with('\n') ? text : text + "\n"));
    CHECK(hooked.empty() || hooked.size() >= kLongestLine || hooked.ends_with(" " + text + "\n"));
  }

  WriteLogLine(text.c_str()), WriteLogLine(file.c_str());
  const auto ended = [](const std::string& s) { return s.ends_with('\n') ? s : s + "\n"; };
  CHECK(TakeLogged(path) == ended(text) + ended(file));
  return 1;
}
