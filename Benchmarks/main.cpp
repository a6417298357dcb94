// SPDX-License-Identifier: MIT
// benchmarks GROUP [FILE]: measures one group and prints its section of the results in Markdown;
// FILE receives the numbers of its chart. Run each group in a separate process. The exit code is 0
// when the group was measured, whether or not the goals are met.
#include <windows.h>
// Needs windows.h before it.
#include <objbase.h>

#include <cstdio>
#include <exception>
#include <filesystem>
#include <string>

#include "CallBenchmark.h"
#include "FileBenchmark.h"
#include "LibraryBenchmark.h"
#include "MacroBenchmark.h"
#include "Module.h"
#include "RunBenchmark.h"
#include "Section.h"

namespace fs = std::filesystem;

struct Group {
  const char* name;
  bool (*measure)(Section& section);
};
// clang-format off: one a line
static constexpr Group kGroups[] = {
    {"calls", CompareCalls},     {"dispatch", CompareDispatch}, {"runs", CompareRuns},
    {"start", CompareFirstRuns}, {"files", CompareMacroFiles},  {"module", CompareModuleFile},
    {"macro", CompareLogMacro},  {"library", CompareLibrary},
};
// clang-format on

// Has the calling thread find the engine beside this program, for the rest of the process.
static bool ActivateEngine() {
  const fs::path manifest = ProgramFolder() / "ruby" / "bin" / "rubyscript.manifest";
  ACTCTXW source = {};
  source.cbSize = sizeof source;
  source.lpSource = manifest.c_str();
  const HANDLE context = CreateActCtxW(&source);
  ULONG_PTR cookie = 0;
  return context != INVALID_HANDLE_VALUE && ActivateActCtx(context, &cookie);
}

static int Main(const std::string& name, const std::string& chartFile) {
  const bool firstRun = name == kFirstRunOption;
  if (FAILED(CoInitialize(nullptr)) || !ActivateEngine()) {
    std::fprintf(stderr, "the engine cannot be activated\n");
    return firstRun ? 0 : 1;
  }
  if (firstRun) return static_cast<int>(FirstRunMicroseconds());
  for (const Group& group : kGroups) {
    if (name != group.name) continue;
    Section section(chartFile);
    return group.measure(section) ? 0 : 1;
  }
  std::fprintf(stderr, "usage: benchmarks GROUP [FILE], a group being one of");
  for (const Group& group : kGroups) std::fprintf(stderr, " %s", group.name);
  std::fprintf(stderr, "\n");
  return 2;
}

int main(int count, char** arguments) {
  try {
    return Main(count > 1 ? arguments[1] : "", count > 2 ? arguments[2] : "");
  } catch (const std::exception& error) {
    std::fprintf(stderr, "%s\n", error.what());
    return 1;
  }
}
