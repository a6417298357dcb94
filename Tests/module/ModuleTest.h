// SPDX-License-Identifier: MIT
// What every test of the module shares: the DLL that ships, loaded from a folder of the test's own,
// one host, one fake engine, and a watcher for message boxes.
#pragma once

#include <gtest/gtest.h>

#include "FakeEngine.h"
#include "RawHost.h"

using Strings = std::vector<std::string>;

constexpr char kDescription[] = "[Options]\r\nLanguage=FakeEngine\r\nFixCRLF=2\r\n";
constexpr char kFaultMessage[] =
    "Tarn has detected an internal scripting exception, most probably caused\n"
    "by something in the syntax of the scripting macro code.\n\n"
    "Please help us by sending a short bug report including the script code\n"
    "that is causing the issue:\n\n"
    "Please send your bug report to this address: support@tarn.example\nTIA.\n\n"
    "Script file Name: ";

// A copy of the DLL in a new folder, loaded from there; both go away with the object.
class LoadedModule {
 public:
  explicit LoadedModule(const std::string& folder, bool makeFolder = true);
  ~LoadedModule();
  std::string DescriptionFile() const { return folder + "\\xMacroWSH.qwsh"; }

  std::string folder;
  HMODULE handle = nullptr;
  int(__stdcall* execute)(const char* file, void* host) = nullptr;
  bool(__stdcall* kill)(int value) = nullptr;
  bool(__stdcall* version)(void* record, const char* path) = nullptr;
};

// Answers every message box of this thread and keeps what it showed as "caption|text|flags".
class BoxWatcher {
 public:
  BoxWatcher();
  ~BoxWatcher();
  Strings shown;

 private:
  HHOOK hook;
};

void WriteBytes(const std::string& path, const std::string& bytes);
std::string TestFolder();  // of this process, made on first use

class ModuleTest : public testing::Test {
 protected:
  static void SetUpTestSuite();
  void SetUp() override;
  void TearDown() override;

  // Runs a macro of these bytes (one blank line by default) on the host.
  int Run(const std::string& macro = "\n");
  static LoadedModule& Module();
  static std::string MacroPath() { return TestFolder() + "\\macro.rbs"; }
  // Makes this the text of the description file.
  static void Describe(const std::string& text) { WriteBytes(Module().DescriptionFile(), text); }

  RawHost host;
};
