// SPDX-License-Identifier: MIT
#include "RunBenchmark.h"

#include <windows.h>

#include <cstdio>
#include <filesystem>
#include <fstream>

#include "Comparison.h"
#include "FakeEngine.h"
#include "RawHost.h"

namespace fs = std::filesystem;

// The host and the engine that does nothing tell what they see; here nobody listens.
void Log(const std::string&) {}

namespace {

constexpr char kRuby[] = "RubyScript";
constexpr char kNothing[] = "JScript";  // whose place the fake engine takes

// A copy of the module, with the description of a language beside it, and an empty macro.
class Module {
 public:
  explicit Module(const std::string& progId)
      : folder(fs::temp_directory_path() /
               ("scriptruby-bench-" + std::to_string(GetCurrentProcessId()) + "-" + progId)),
        macro((folder / "empty.rbs").string()) {
    fs::create_directories(folder);
    const fs::path copy = folder / "scriptruby.dll";
    fs::copy_file(ProgramFolder() / "scriptruby.dll", copy, fs::copy_options::overwrite_existing);
    std::ofstream(folder / "xMacroWSH.qwsh") << "[Options]\nLanguage=" << progId << "\n";
    std::ofstream(macro).close();
    dll = LoadLibraryW(copy.c_str());
    void* const function = reinterpret_cast<void*>(GetProcAddress(dll, "execute"));
    execute = reinterpret_cast<Execute>(function);
  }
  ~Module() {
    FreeLibrary(dll);
    std::error_code ignored;
    fs::remove_all(folder, ignored);
  }
  Module(const Module&) = delete;
  Module& operator=(const Module&) = delete;

  // Seconds of one run; negative when it has failed.
  double TimeRun() {
    const double start = Now();
    if (execute && execute(macro.c_str(), &host) == 1) return Now() - start;
    std::fprintf(stderr, "the empty macro failed\n");
    return -1;
  }

 private:
  using Execute = int(__stdcall*)(const char* file, RawHost* host);
  const fs::path folder;
  const std::string macro;
  HMODULE dll;
  Execute execute;
  RawHost host;
};

struct Process {
  double seconds;
  DWORD exitCode;
};

// From its creation to its end. 259, the code of a process that goes on, also tells of failure.
Process TimeProcess(std::wstring commandLine) {
  STARTUPINFOW start = {};
  start.cb = sizeof start;
  PROCESS_INFORMATION process = {};
  const double begin = Now();
  if (!CreateProcessW(nullptr, commandLine.data(), nullptr, nullptr, FALSE, 0, nullptr, nullptr,
                      &start, &process))
    return {0, STILL_ACTIVE};
  WaitForSingleObject(process.hProcess, INFINITE);
  Process result = {Now() - begin, STILL_ACTIVE};
  GetExitCodeProcess(process.hProcess, &result.exitCode);
  CloseHandle(process.hThread);
  CloseHandle(process.hProcess);
  return result;
}

std::wstring CommandLine(const fs::path& program, const char* arguments) {
  return L"\"" + program.wstring() + L"\" " + fs::path(arguments).wstring();
}

}  // namespace

fs::path ProgramFolder() {
  wchar_t path[MAX_PATH] = L"";
  GetModuleFileNameW(nullptr, path, MAX_PATH);
  return fs::path(path).parent_path();
}

bool CompareLaterRuns() {
  constexpr int kRounds = 11;
  constexpr int kRuns = 50;
  RegisterFakeEngine();
  Module ruby(kRuby);
  Module nothing(kNothing);
  if (ruby.TimeRun() < 0) return false;  // which starts the engine
  Comparison comparison("later run of a macro : no engine", Comparison::Measure::kDifference, 1e-3);
  for (int round = 0; round < kRounds; ++round) {
    std::vector<double> times;
    std::vector<double> peers;
    for (int run = 0; run < kRuns; ++run) {
      times.push_back(ruby.TimeRun());
      peers.push_back(nothing.TimeRun());
      if (times.back() < 0 || peers.back() < 0) return false;
    }
    comparison.Add(Median(times), Median(peers));
  }
  comparison.Print();
  return true;
}

unsigned FirstRunMicroseconds() {
  Module module(kRuby);
  const double seconds = module.TimeRun();
  return seconds < 0 ? 0 : static_cast<unsigned>(seconds * 1e6);
}

bool CompareFirstRuns() {
  constexpr int kRounds = 11;
  const fs::path folder = ProgramFolder();
  const std::wstring own = CommandLine(folder / "benchmarks.exe", kFirstRunOption);
  const std::wstring ruby = CommandLine(folder / "ruby" / "bin" / "ruby.exe", "-e \"\"");
  Comparison run("first run of a macro : ruby.exe", Comparison::Measure::kRatio, 0.5);
  Comparison whole("  with its process : ruby.exe", Comparison::Measure::kRatio, 0.5);
  for (int round = 0; round < kRounds; ++round) {
    const Process first = TimeProcess(own);
    const Process peer = TimeProcess(ruby);
    if (first.exitCode == 0 || first.exitCode == STILL_ACTIVE || peer.exitCode != 0) {
      std::fprintf(stderr, "a process failed: exit codes %lu and %lu\n", first.exitCode,
                   peer.exitCode);
      return false;
    }
    run.Add(first.exitCode / 1e6, peer.seconds);
    whole.Add(first.seconds, peer.seconds);
  }
  run.Print();
  whole.Print();
  return true;
}
