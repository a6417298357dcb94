// SPDX-License-Identifier: MIT
#include "RunBenchmark.h"

#include <cstdio>

#include "BareObject.h"
#include "Description.h"
#include "Module.h"
#include "Process.h"
#include "Section.h"

namespace fs = std::filesystem;

namespace {

constexpr int kRuns = 30;  // a side and a round

double TimeBareSteps(const wchar_t* progId) {
  static BareObject object;
  const double start = Now();
  const HRESULT result = RunBare(progId, object, L"");
  return SUCCEEDED(result) ? Now() - start : -1;
}

// Opening, sizing, reading and closing the macro's file.
double TimeFileRead(const std::string& file) {
  const double start = Now();
  const HANDLE handle = CreateFileA(file.c_str(), GENERIC_READ, FILE_SHARE_READ, nullptr,
                                    OPEN_EXISTING, FILE_ATTRIBUTE_NORMAL, nullptr);
  char bytes[16];
  DWORD read = GetFileSize(handle, nullptr);
  const bool opened = ReadFile(handle, bytes, sizeof bytes, &read, nullptr);
  CloseHandle(handle);
  return opened ? Now() - start : -1;
}

double TimeSectionRead(const Module& module) {
  const std::wstring file = module.DescriptionFile().wstring();
  wchar_t entries[4096];
  const double start = Now();
  const DWORD size = GetPrivateProfileSectionW(L"Options", entries, 4096, file.c_str());
  return size ? Now() - start : -1;
}

template <class Own, class Peer>
bool CompareEach(Section& section, Comparison comparison, Own own, Peer peer) {
  if (!comparison.Measured(own, peer, kRuns)) {
    std::fprintf(stderr, "a run failed\n");
    return false;
  }
  section.Add(comparison);
  return true;
}

bool CompareJScriptRuns(Section& section) {
  using Measure = Comparison::Measure;
  Module module(JScriptDescription());
  const std::string macro = module.Macro("empty.js", "");
  const auto run = [&] { return module.TimeRun(macro); };
  const auto steps = [] { return TimeBareSteps(L"JScript"); };
  const auto stepsAndReads = [&] {
    const double reads = TimeReads(module.DescriptionFile());
    const double time = steps();
    return reads < 0 || time < 0 ? -1 : reads + time;
  };
  const auto stepsAndFiles = [&] {
    const double files = TimeSectionRead(module) + TimeFileRead(macro);
    const double time = steps();
    return files < 0 || time < 0 ? -1 : files + time;
  };
  if (run() < 0) return false;
  return CompareEach(section, {"JScript : engine and profile reads", Measure::kRatio, 1}, run,
                     stepsAndReads) &&
         CompareEach(section, {"JScript : engine alone", Measure::kRatio, 1.5}, run, steps) &&
         CompareEach(section, Comparison("JScript : engine and one read of each file"), run,
                     stepsAndFiles) &&
         CompareEach(section, Comparison("(engine and one read of each file : engine alone)"),
                     stepsAndFiles, steps) &&
         CompareEach(
             section, Comparison("(fifteen profile reads : engine alone)"),
             [&] { return TimeReads(module.DescriptionFile()); }, steps) &&
         CompareEach(
             section, Comparison("(one read of the section : engine alone)"),
             [&] { return TimeSectionRead(module); }, steps) &&
         CompareEach(
             section, Comparison("(one read of the macro file : engine alone)"),
             [&] { return TimeFileRead(macro); }, steps);
}

constexpr char kEvaluation[] =
    "start = Process.clock_gettime(Process::CLOCK_MONOTONIC)\n"
    "100.times { eval('') }\n"
    "@tarn.take(0, 0, (Process.clock_gettime(Process::CLOCK_MONOTONIC) - start) / 100)\n";

bool CompareRubyRuns(Section& section) {
  Module ruby("");
  const std::string macro = ruby.Macro("empty.rbs", "");
  const auto run = [&] { return ruby.TimeRun(macro); };
  if (run() < 0) return false;  // which starts the engine
  const std::string evaluation = ruby.Macro("evaluation.rbs", kEvaluation);
  const auto evaluate = [&] {
    Comparison received("");
    ruby.host.comparisons = &received;
    return ruby.TimeRun(evaluation) < 0 ? -1 : received.PeerTime();
  };
  using Measure = Comparison::Measure;
  return CompareEach(section,
                     {"Ruby, a later run : `eval('')` in Ruby", Measure::kDifference, 1e-3}, run,
                     evaluate) &&
         CompareEach(section, {"Ruby, a later run : engine alone", Measure::kRatio, 1.5}, run,
                     [] { return TimeBareSteps(L"RubyScript"); });
}

}  // namespace

bool CompareRuns(Section& section) {
  section.Begin("Running an empty macro",
                "`execute`, from the call to its return. \"Engine\" means the engine's steps "
                "without the module: create it, give it a site and `tarn`, parse, connect, close. "
                "JScript has the description file that ships with `macrorun`, Ruby none. "
                "The module has to read two files for each run, the description and the macro, "
                "each time: the rows in brackets show what that alone costs. The first of "
                "them is the least that any module can reach.");
  section.Head();
  return CompareJScriptRuns(section) && CompareRubyRuns(section);
}

unsigned FirstRunMicroseconds() {
  Module module("");
  const double seconds = module.TimeRun(module.Macro("empty.rbs", ""));
  return seconds < 0 ? 0 : static_cast<unsigned>(seconds * 1e6);
}

bool CompareFirstRuns(Section& section) {
  const fs::path folder = ProgramFolder();
  const std::wstring own =
      CommandLine(folder / "benchmarks.exe", fs::path(kFirstRunOption).wstring());
  const std::wstring ruby = CommandLine(folder / "ruby" / "bin" / "ruby.exe", L"-e \"\"");
  using Measure = Comparison::Measure;
  Comparison run("Ruby, the first run : process `ruby.exe -e \"\"`", Measure::kRatio, 0.5);
  Comparison whole("the same with its process : process `ruby.exe -e \"\"`", Measure::kRatio, 0.5);
  for (int round = 0; round < Comparison::kRounds; ++round) {
    const ProcessTime first = TimeProcess(own);
    const ProcessTime peer = TimeProcess(ruby);
    if (first.exitCode == 0 || first.exitCode == STILL_ACTIVE || peer.exitCode != 0) {
      std::fprintf(stderr, "a process failed: exit codes %lu and %lu\n", first.exitCode,
                   peer.exitCode);
      return false;
    }
    run.Add(first.exitCode / 1e6, peer.seconds);
    whole.Add(first.seconds, peer.seconds);
  }
  section.Begin("Starting Ruby", "The first macro of a process, which starts the interpreter.");
  section.Head();
  section.Add(run);
  section.Add(whole);
  return true;
}
