// SPDX-License-Identifier: MIT
// The base of the module's tests: the DLL that ships, loaded from a temporary folder, one host, one
// fake engine whose script calls f(1), and a transcript. The transcript logs in order what the host,
// the engine and the user's screen receive, and at the end what the module has reported. Each test
// ends by comparing it with golden/<suite>.<test>.txt, so an unexpected call fails by itself. With
// SCRIPTRUBY_PROMOTE=1 the files are rewritten instead.
#pragma once

#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>

#include "FakeEngine.h"
#include "RawHost.h"
#include "Resources.h"

using namespace std::string_literals;

// Copies the DLL to the folder and loads it from there. The environment variable SCRIPTRUBY_TEST_DLL
// can name another DLL than the one that ships.
HMODULE LoadModule(const std::string& folder);
// Lets COM find the Ruby engine that ships. Returns the cookie for DeactivateActCtx.
ULONG_PTR ActivateRuby();
inline HMODULE dll;  // loaded from testFolder

template <class Result, class... Arguments>
Result CallExport(HMODULE module, const char* name, Arguments... arguments) {
  void* const function = reinterpret_cast<void*>(GetProcAddress(module, name));
  return reinterpret_cast<Result(__stdcall*)(Arguments...)>(function)(arguments...);
}
inline bool Kill(int value) { return CallExport<bool>(dll, "kill", value); }
inline int ExecuteFor(RawHost* host, const char* file) {
  return CallExport<int>(dll, "execute", file, host);
}

// Of this process.
inline const std::string testFolder = std::filesystem::temp_directory_path().string() +
                                      "scriptruby-tests-" + std::to_string(GetCurrentProcessId());
inline const std::string macroPath = testFolder + "\\macro.rbs";

inline void WriteBytes(const std::string& path, const std::string& bytes) {
  std::ofstream(path, std::ios::binary) << bytes;
}

inline std::string transcript;  // of the running test
std::string ModuleLog();        // what the module has written to its log since the test began

class ModuleTest : public testing::Test {
 protected:
  ModuleTest();
  void TearDown() override;

  // Logs and writes the description file: lines of its section.
  static void Describe(const std::string& lines) {
    Log("--- " + lines);
    WriteBytes(testFolder + "\\xMacroWSH.qwsh", "[Options]\r\n" + lines);
  }
  // Runs a macro on the host and logs the result.
  int Run(const std::string& path = macroPath);
  // Runs the test's body as the script.
  void Script(const std::function<void()>& body) { on["engine: SetScriptState 2"] = body, Run(); }

  RawHost host;
  const unsigned handles = Used().handles;
};
