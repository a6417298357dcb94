// SPDX-License-Identifier: MIT
// What every test of the module shares: the DLL that ships, loaded from a folder of the test's own,
// one host, one fake engine, and a transcript. Whatever the host, the engine and the user's screen
// see is logged in order, and the end of each test compares it with golden/<suite>.<test>.txt, so
// an unexpected call fails by itself. With SCRIPTRUBY_PROMOTE=1 the files are rewritten instead.
#pragma once

#include <gtest/gtest.h>

#include "FakeEngine.h"
#include "RawHost.h"

// A copy of the DLL in a folder of its own, loaded from there.
struct LoadedModule {
  explicit LoadedModule(const std::string& folder);
  ~LoadedModule() { FreeLibrary(handle); }

  HMODULE handle;
  int(__stdcall* execute)(const char* file, void* host);
  bool(__stdcall* kill)(int value);
  bool(__stdcall* version)(void* record, const char* path);
};

void WriteBytes(const std::string& path, const std::string& bytes);
std::string TestFolder();  // of this process, made on first use
inline std::string MacroPath() { return TestFolder() + "\\macro.rbs"; }

class ModuleTest : public testing::Test {
 protected:
  ModuleTest();
  void TearDown() override;

  static LoadedModule& Module();
  // Writes the description file: lines of its section.
  static void Describe(const std::string& lines) {
    WriteBytes(TestFolder() + "\\xMacroWSH.qwsh", "[Options]\r\n" + lines);
  }
  // Runs a macro of these bytes on the host and logs the result; `plan` plays it.
  int Run(const std::string& macro = "\n");
  int Execute(const std::string& path);

  RawHost host;
};
