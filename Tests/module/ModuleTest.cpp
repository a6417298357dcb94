// SPDX-License-Identifier: MIT
#include "ModuleTest.h"

#include <filesystem>
#include <fstream>
#include <iterator>

bool muted = false;
static std::string transcript;

void WriteBytes(const std::string& path, const std::string& bytes) {
  std::ofstream(path, std::ios::binary) << bytes;
}

std::string TestFolder() {
  static const std::string folder = [] {
    const auto path = std::filesystem::temp_directory_path() /
                      ("scriptruby-tests-" + std::to_string(GetCurrentProcessId()));
    std::filesystem::create_directories(path);
    return path.string();
  }();
  return folder;
}

void Log(const std::string& text) {
  if (muted) return;
  std::string line = text;
  // What differs between machines has a name of its own.
  const std::string folder = TestFolder();
  for (size_t at; (at = line.find(folder)) != std::string::npos;)
    line.replace(at, folder.size(), "FOLDER");
  for (const char ch : line) {
    if (ch >= ' ' && ch < 127)
      transcript += ch;
    else if (ch == '\n')
      transcript += "\\n\n    ";
    else
      transcript += "<" + Hex(static_cast<unsigned char>(ch)).substr(6) + ">";
  }
  transcript += "\n";
}

LoadedModule::LoadedModule(const std::string& folder) {
  std::error_code alreadyThere;
  std::filesystem::create_directories(folder, alreadyThere);
  std::filesystem::copy_file(SCRIPTRUBY_DLL, folder + "\\scriptruby.dll", alreadyThere);
  handle = LoadLibraryA((folder + "\\scriptruby.dll").c_str());
  const auto import = [this](const char* name, auto& function) {
    function = reinterpret_cast<std::decay_t<decltype(function)>>(
        reinterpret_cast<void*>(GetProcAddress(handle, name)));
  };
  import("execute", execute);
  import("kill", kill);
  import("version", version);
}

LoadedModule& ModuleTest::Module() {
  static LoadedModule module(TestFolder());
  return module;
}

ModuleTest::ModuleTest() {
  plan = EnginePlan();
  transcript.clear();
  muted = false;
  liveEngines = 0;
  Describe("Language=FakeEngine\r\nFixCRLF=2\r\n");
}

// Whatever a test did, the module must have left nothing behind.
void ModuleTest::TearDown() {
  EXPECT_TRUE(host.IsClean());
  EXPECT_FALSE(Module().kill(1)) << "a host is still current";
  const testing::TestInfo& test = *testing::UnitTest::GetInstance()->current_test_info();
  const std::string golden =
      std::string(GOLDEN_FOLDER) + "/" + test.test_suite_name() + "." + test.name() + ".txt";
  if (std::getenv("SCRIPTRUBY_PROMOTE")) WriteBytes(golden, transcript);
  std::ifstream file(golden, std::ios::binary);
  EXPECT_EQ(std::string(std::istreambuf_iterator<char>(file), {}), transcript) << golden;
}

int ModuleTest::Run(const std::string& macro) {
  WriteBytes(MacroPath(), macro);
  return Execute(MacroPath());
}

int ModuleTest::Execute(const std::string& path) {
  const int result = Module().execute(path.c_str(), host.Interface());
  Log("execute returned " + std::to_string(result) + (host.IsClean() ? "" : ", not clean") +
      (liveEngines ? ", " + std::to_string(liveEngines) + " engine objects live" : ""));
  return result;
}

// Logs every message box of the thread and answers it.
static LRESULT CALLBACK OnWindow(int code, WPARAM window, LPARAM data) {
  const HWND box = reinterpret_cast<HWND>(window);
  char text[1024] = "";
  GetClassNameA(box, text, sizeof text);
  if (code == HCBT_ACTIVATE && std::string(text) == "#32770") {
    GetWindowTextA(box, text, sizeof text);
    const std::string caption = text;
    GetDlgItemTextA(box, 0xFFFF, text, sizeof text);
    const HWND icon = FindWindowExA(box, nullptr, "Static", nullptr);
    const bool stop = reinterpret_cast<HICON>(SendMessageA(icon, STM_GETICON, 0, 0)) ==
                      LoadIconA(nullptr, IDI_HAND);
    Log("box \"" + caption + (stop ? "\" with the stop icon: " : "\": ") + text);
    EndDialog(box, IDOK);
  }
  return CallNextHookEx(nullptr, code, window, data);
}

int main(int argc, char** argv) {
  testing::InitGoogleTest(&argc, argv);
  CoInitialize(nullptr);
  RegisterFakeEngine();
  SetWindowsHookExA(WH_CBT, OnWindow, nullptr, GetCurrentThreadId());
  const int result = RUN_ALL_TESTS();
  std::error_code ignored;  // the loaded module keeps its file
  std::filesystem::remove_all(TestFolder(), ignored);
  return result;
}
