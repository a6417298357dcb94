// SPDX-License-Identifier: MIT
#include "ModuleTest.h"

#include <iterator>
#include <regex>
#include <set>

#include "Imports.h"

namespace fs = std::filesystem;

// Of this process. No variable: its start and that of `testFolder` have no order.
static std::string LogPath() { return testFolder + "\\module.log"; }

static std::string ReadBytes(const std::string& path) {
  std::ifstream file(path, std::ios::binary);
  return std::string(std::istreambuf_iterator<char>(file), {});
}

std::string ModuleLog() { return ReadBytes(LogPath()); }

static std::string Escape(char ch) {
  if (ch == '\n') return "\\n\n    ";
  return ch >= ' ' && ch < 127 ? std::string(1, ch) : "<" + Hex(ch & 0xFF).substr(6) + ">";
}

void Log(const std::string& line) {
  for (const char ch : muted ? "" : line) transcript += Escape(ch);
  if (!muted) transcript += "\n";
  for (const auto& [beginning, act] : on)
    if (line.starts_with(beginning)) {
      const std::function<void()> planned = act;  // which may plan something else
      return planned();
    }
}

// A box's flags are the ones of an error without owner, or they show.
static int WINAPI ShowBox(HWND owner, LPCSTR text, LPCSTR caption, UINT flags) {
  const bool plain = !owner && flags == (MB_OK | MB_ICONSTOP);
  Log((plain ? "stop box "s : "box of flags " + std::to_string(flags) + " ") + caption + ": " +
      text);
  return IDOK;
}

HMODULE LoadModule(const std::string& folder) {
  const std::string path = folder + "\\scriptruby.dll";
  fs::create_directories(folder);
  const char* const other = std::getenv("SCRIPTRUBY_TEST_DLL");
  fs::copy_file(other ? other : SCRIPTRUBY_DLL, path, fs::copy_options::overwrite_existing);
  const HMODULE module = LoadLibraryA(path.c_str());
  ReplaceImport(module, "MessageBoxA", reinterpret_cast<void*>(ShowBox));
  return module;
}

ULONG_PTR ActivateRuby() {
  ACTCTXA manifest = {sizeof manifest, 0, RUBY_MANIFEST, 0, 0, nullptr, nullptr, nullptr, nullptr};
  ULONG_PTR cookie = 0;
  EXPECT_TRUE(ActivateActCtx(CreateActCtxA(&manifest), &cookie)) << GetLastError();
  return cookie;
}

ModuleTest::ModuleTest() {
  on = {{"engine: SetScriptState 2", [] { Call(L"f", {Value(VT_I4, 1)}); }}};
  results.clear();
  transcript.clear();
  muted = false;
  fs::remove(LogPath());
  Describe("Language=JScript\r\nFixCRLF=2\r\n"), WriteBytes(macroPath, "\n");
}

// Replaces a block of lines, from its second occurrence on, by its name.
static void Shorten(const std::string& first, const std::string& last, const std::string& name) {
  const size_t start = transcript.find(first), end = transcript.find(last, start);
  if (start == std::string::npos || end == std::string::npos) return;
  const std::string block = transcript.substr(start, end + last.size() - start);
  for (size_t at = end; (at = transcript.find(block, at)) != std::string::npos;)
    transcript.replace(at, block.size(), name);
}

// Checks that the module has left nothing, whatever the test did.
void ModuleTest::TearDown() {
  EXPECT_TRUE(host.IsClean());
  EXPECT_FALSE(Kill(1)) << "a host is still current";
  // The system's libraries keep some from their first use; the Ruby engine keeps its thread's, its
  // mark of the process and its event.
  EXPECT_LE(Used().handles, handles + 13) << "left open";
  const testing::TestInfo& test = *testing::UnitTest::GetInstance()->current_test_info();
  const std::string golden =
      GOLDEN_FOLDER "/"s + test.test_suite_name() + "." + test.name() + ".txt";
  // What the module itself has logged, each line once, without times and without line numbers but
  // for the one that is fixed.
  static const std::regex line(
      R"-(\] (\w+) +"(\w+)"( \(899\))?(?: \([1-9]\d+\))? +>> ([^\r\n]*))-");
  const std::string log = ModuleLog();
  std::set<std::string> logged;
  for (std::sregex_iterator match(log.begin(), log.end(), line), end; match != end; ++match)
    logged.insert("logged: " + std::regex_replace(match->str(), line, "$1 $2$3 $4"));
  muted = false;
  for (const std::string& each : logged) Log(each);
  // Parts that differ between machines are replaced by names.
  for (size_t at; (at = transcript.find(testFolder)) != std::string::npos;)
    transcript.replace(at, testFolder.size(), "FOLDER");
  Shorten("report: Tarn has", "TIA.\\n\n    \\n\n    ", "report: the fault text, ");
  Shorten("trace: Init", "engine: AddNamedItem tarn 2\n", "trace and engine: the usual start\n");
  if (std::getenv("SCRIPTRUBY_PROMOTE")) WriteBytes(golden, transcript);
  EXPECT_EQ(ReadBytes(golden), transcript) << golden;
}

int ModuleTest::Run(const std::string& path) {
  const int references = engineReferences;
  const int result = ExecuteFor(&host, path.c_str());
  Log("execute returned " + std::to_string(result) + (host.IsClean() ? "" : ", not clean") +
      ", references to engines left: " + std::to_string(engineReferences - references));
  return result;
}

int main(int argc, char** argv) {
  testing::InitGoogleTest(&argc, argv);
  CoInitialize(nullptr);
  RegisterFakeEngine();
  SetEnvironmentVariableA("SCRIPTRUBY_LOG", LogPath().c_str());
  dll = LoadModule(testFolder);
  const int result = RUN_ALL_TESTS();
  FreeLibrary(dll);
  fs::remove_all(testFolder);
  return result;
}
