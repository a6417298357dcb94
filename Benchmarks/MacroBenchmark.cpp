// SPDX-License-Identifier: MIT
#include "MacroBenchmark.h"

#include <cstdio>
#include <fstream>
#include <iterator>
#include <random>

#include "Module.h"
#include "Process.h"
#include "Section.h"

namespace fs = std::filesystem;

namespace {

constexpr char kMacro[] = {
#embed "log-macro.rbs" suffix(, 0)
};
constexpr char kProgram[] = {
#embed "log-plain.rb" suffix(, 0)
};

constexpr std::size_t kLogSize = 20u << 20;

// The same lines each time; one of twenty is an error.
std::string LogText() {
  static constexpr const char* kParts[] = {"network", "storage", "printer", "session", "backup"};
  static constexpr const char* kLevels[] = {"INFO", "DEBUG", "WARNING"};
  std::mt19937 random(20);
  std::string text;
  text.reserve(kLogSize + 200);
  for (unsigned line = 0; text.size() < kLogSize; ++line) {
    const unsigned bits = random();
    char buffer[200];
    std::snprintf(buffer, sizeof buffer,
                  "2024-05-%02u %02u:%02u:%02u.%03u %s [%s] request %08x took %u ms and moved %u "
                  "bytes\n",
                  1 + line / 12000, line / 500 % 24, line / 9 % 60, line % 60, bits % 1000,
                  bits % 20 ? kLevels[bits % 3] : "ERROR", kParts[bits / 64 % 5], random(),
                  bits / 16 % 4000, bits / 7);
    text += buffer;
  }
  return text;
}

std::string Quoted(const fs::path& path) { return "\"" + path.string() + "\""; }

std::string ReadFile(const fs::path& path) {
  std::ifstream file(path, std::ios::binary);
  return std::string(std::istreambuf_iterator<char>(file), {});
}

// Negative when the program has failed.
double TimeProgram(const fs::path& program, const std::string& arguments, const fs::path& output) {
  const ProcessTime time = TimeProcess(CommandLine(program, fs::path(arguments).wstring()), output);
  if (time.exitCode == 0) return time.seconds;
  std::fprintf(stderr, "%s ended with %lu\n", program.string().c_str(), time.exitCode);
  return -1;
}

}  // namespace

bool CompareLogMacro(Section& section) {
  const fs::path folder = ProgramFolder();
  // Only for a folder that goes away by itself.
  Module module("");
  const fs::path log = module.Macro("log.txt", LogText());
  const fs::path macro = module.Macro("log-macro.rbs", kMacro);
  const fs::path program = module.Macro("log-plain.rb", kProgram);
  const fs::path own = module.Folder() / "own.txt";
  const fs::path peer = module.Folder() / "peer.txt";
  const auto runMacro = [&] {
    return TimeProgram(folder / "macrorun.exe", Quoted(macro) + " " + Quoted(log), own);
  };
  using Measure = Comparison::Measure;
  Comparison comparisons[] = {
      {"macrorun : ruby.exe", Measure::kRatio, 1.5},
      {"macrorun : ruby.exe, the file read as binary", Measure::kRatio, 1.5}};
  for (Comparison& each : comparisons) {
    const std::string mode = &each == comparisons ? " r" : " rb";
    const auto runProgram = [&] {
      return TimeProgram(folder / "ruby" / "bin" / "ruby.exe",
                         Quoted(program) + " " + Quoted(log) + mode, peer);
    };
    if (!each.Measured(runMacro, runProgram)) return false;
    if (ReadFile(own) != ReadFile(peer) || ReadFile(own).size() < kLogSize / 100) {
      std::fprintf(stderr, "the macro and the program have not written the same\n");
      return false;
    }
  }
  section.Begin("A macro over a log",
                "A log of 20 MB (some 220,000 lines): the errors among its lines, sorted, below "
                "their number for each part of the system. The macro takes every line out of the "
                "editor and puts the result there; the program reads the file and "
                "prints. Both are whole processes.");
  section.Head();
  for (const Comparison& each : comparisons) section.Add(each);
  return true;
}
