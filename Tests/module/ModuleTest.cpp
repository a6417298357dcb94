// SPDX-License-Identifier: MIT
#include "ModuleTest.h"

#include <filesystem>
#include <fstream>
#include <memory>

static std::unique_ptr<LoadedModule> sharedModule;
static BoxWatcher* watcher = nullptr;

std::string TestFolder() {
  static const std::string folder = [] {
    const auto path = std::filesystem::temp_directory_path() /
                      ("scriptruby-tests-" + std::to_string(GetCurrentProcessId()));
    std::filesystem::create_directories(path);
    return path.string();
  }();
  return folder;
}

void WriteBytes(const std::string& path, const std::string& bytes) {
  std::ofstream(path, std::ios::binary) << bytes;
}

template <class F>
static void Import(HMODULE module, const char* name, F& function) {
  function = reinterpret_cast<F>(reinterpret_cast<void*>(GetProcAddress(module, name)));
}

LoadedModule::LoadedModule(const std::string& folder, bool makeFolder) : folder(folder) {
  if (makeFolder) {
    std::filesystem::create_directories(folder);
    std::filesystem::copy_file(SCRIPTRUBY_DLL, folder + "\\scriptruby.dll",
                               std::filesystem::copy_options::overwrite_existing);
  }
  handle = LoadLibraryA((folder + "\\scriptruby.dll").c_str());
  Import(handle, "execute", execute);
  Import(handle, "kill", kill);
  Import(handle, "version", version);
}

LoadedModule::~LoadedModule() { FreeLibrary(handle); }

static LRESULT CALLBACK OnWindow(int code, WPARAM window, LPARAM data) {
  if (code == HCBT_ACTIVATE) {
    const HWND box = reinterpret_cast<HWND>(window);
    char name[16] = "";
    GetClassNameA(box, name, sizeof name);
    if (std::string(name) != "#32770") return 0;  // not a dialog
    char caption[64] = "", text[1024] = "";
    GetWindowTextA(box, caption, sizeof caption);
    GetDlgItemTextA(box, 0xFFFF, text, sizeof text);
    const bool hasIcon = GetDlgItem(box, 20) || GetDlgItem(box, 1088);
    watcher->shown.push_back(std::string(caption) + "|" + text + (hasIcon ? "|icon" : ""));
    EndDialog(box, IDNO);
  }
  return CallNextHookEx(nullptr, code, window, data);
}

BoxWatcher::BoxWatcher() {
  watcher = this;
  hook = SetWindowsHookExA(WH_CBT, OnWindow, nullptr, GetCurrentThreadId());
}

BoxWatcher::~BoxWatcher() { UnhookWindowsHookEx(hook); }

LoadedModule& ModuleTest::Module() { return *sharedModule; }

void ModuleTest::SetUpTestSuite() {
  if (!sharedModule) sharedModule = std::make_unique<LoadedModule>(TestFolder());
  ASSERT_TRUE(Module().execute && Module().kill && Module().version);
}

void ModuleTest::SetUp() {
  plan = EnginePlan();
  Describe(kDescription);
}

// Whatever a test did, the module must have left nothing behind.
void ModuleTest::TearDown() {
  EXPECT_TRUE(host.IsClean());
  EXPECT_FALSE(Module().kill(1)) << "a host is still current";
}

int ModuleTest::Run(const std::string& macro) {
  WriteBytes(MacroPath(), macro);
  return Module().execute(MacroPath().c_str(), host.Interface());
}

int main(int argc, char** argv) {
  testing::InitGoogleTest(&argc, argv);
  CoInitialize(nullptr);
  int result;
  {
    FakeEngineClass registered;
    result = RUN_ALL_TESTS();
    sharedModule.reset();
  }
  std::error_code ignored;
  std::filesystem::remove_all(TestFolder(), ignored);
  CoUninitialize();
  return result;
}
