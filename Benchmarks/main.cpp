// SPDX-License-Identifier: MIT
// benchmarks [calls | later | first]: prints the table, or the lines of one of its parts. The exit
// code tells whether it could, not whether the goals are met.
#include <windows.h>
// Needs windows.h before it.
#include <objbase.h>

#include <cstdio>
#include <exception>
#include <filesystem>
#include <string>

#include "CallBenchmark.h"
#include "Comparison.h"
#include "RunBenchmark.h"

namespace fs = std::filesystem;

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

static int Main(const std::string& part) {
  const bool firstRun = part == kFirstRunOption;
  if (FAILED(CoInitialize(nullptr)) || !ActivateEngine()) {
    std::fprintf(stderr, "the engine cannot be activated\n");
    return firstRun ? 0 : 1;
  }
  if (firstRun) return static_cast<int>(FirstRunMicroseconds());

  PrintHead();
  bool succeeded = true;
  if (part.empty() || part == "calls") succeeded = CompareCalls() && succeeded;
  if (part.empty() || part == "later") succeeded = CompareLaterRuns() && succeeded;
  if (part.empty() || part == "first") succeeded = CompareFirstRuns() && succeeded;
  return succeeded ? 0 : 1;
}

int main(int count, char** arguments) {
  try {
    return Main(count > 1 ? arguments[1] : "");
  } catch (const std::exception& error) {
    std::fprintf(stderr, "%s\n", error.what());
    return 1;
  }
}
