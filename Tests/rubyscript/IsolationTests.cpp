// SPDX-License-Identifier: MIT
// Whatever a macro does to Ruby, the next one finds it as new. The tables in `intrusive` hold such
// macros, separated by lines that begin with "# ---". Such a line may continue with a remark or with
//   interrupt   the host interrupts the macro after 200 ms
//   once        the macro's second run in the process differs from its first
//   > TEXT      what the host logs of the macro
#include "EngineHost.h"

#include <fstream>
#include <random>
#include <regex>
#include <thread>

#include "../module/Resources.h"

namespace {

struct IntrusiveMacro {
  std::string place;  // file and line
  std::string text, directive;

  bool Has(const char* word) const { return directive.rfind(word, 0) == 0; }
};

void ReadTable(const std::string& file, std::vector<IntrusiveMacro>& macros) {
  std::ifstream table(TRANSCRIPTS "/../intrusive/" + file, std::ios::binary);
  int number = 1;
  bool inMacro = false;
  for (std::string line; std::getline(table, line); ++number) {
    if (line.rfind("# ---", 0) == 0) {
      macros.push_back({file + ":" + std::to_string(number), "", line.substr(5)});
      macros.back().directive.erase(0, macros.back().directive.find_first_not_of(' '));
      inMacro = true;
    } else if (inMacro) {
      macros.back().text += line + "\n";
    }
  }
}

// All tables; with SCRIPTRUBY_TEST_TABLE only the named one.
std::vector<IntrusiveMacro> ReadTables() {
  std::vector<IntrusiveMacro> macros;
  const char* const wanted = std::getenv("SCRIPTRUBY_TEST_TABLE");
  WIN32_FIND_DATAA found;
  const HANDLE search = FindFirstFileA(TRANSCRIPTS "/../intrusive/*.rb", &found);
  do
    if (!wanted || std::string(wanted) == found.cFileName) ReadTable(found.cFileName, macros);
  while (FindNextFileA(search, &found));
  FindClose(search);
  EXPECT_FALSE(macros.empty());
  return macros;
}

class Isolation : public testing::Test {
 protected:
  Isolation() {
    for (const char* function : {"f", "message"}) host.item.Add(function);
    CheckTranscript("right.txt", [&](const std::string& macro) {
      right = macro;
      return outcome = RunRight();
    });
  }

  // A macro that does not end by itself is interrupted, after a while with a failure.
  std::string Run(const IntrusiveMacro& macro) {
    if (std::getenv("SCRIPTRUBY_TEST_VERBOSE")) std::cout << macro.place << std::endl;
    const HANDLE ended = CreateEventA(nullptr, TRUE, FALSE, nullptr);
    host.Open();
    std::thread watch([&] {
      const bool wanted = macro.Has("interrupt");
      if (WaitForSingleObject(ended, wanted ? 200 : 60000) == WAIT_OBJECT_0) return;
      EXPECT_TRUE(wanted) << macro.place << " does not end";
      host.script->InterruptScriptThread(SCRIPTTHREADID_BASE, nullptr, 0);
    });
    if (SUCCEEDED(host.Parse(macro.text))) host.Start();
    SetEvent(ended);
    watch.join();
    CloseHandle(ended);
    host.Close();
    return std::regex_replace(TakeLog(), std::regex("0x[0-9a-f]+"), "0x");  // addresses
  }

  std::string RunRight() {
    std::string log = host.Run(right);
    return log + "; " + host.error.text;
  }

  void ExpectRight(const IntrusiveMacro& last) {
    ASSERT_EQ(outcome, RunRight()) << last.place << "\n" << last.text;
  }

  // `seed` of the random order; prints it.
  static unsigned Seed() {
    const char* const given = std::getenv("SCRIPTRUBY_TORTURE_SEED");
    const unsigned seed =
        given ? static_cast<unsigned>(std::strtoul(given, nullptr, 10)) : std::random_device()();
    std::cout << "SCRIPTRUBY_TORTURE_SEED=" << seed << std::endl;
    return seed;
  }

  // After a collection of what macros have left.
  Resources UsedNow() {
    host.Run("3.times { GC.start }");
    return Used();
  }

  Host host;

 private:
  std::string right, outcome;
};

}  // namespace

// In one process, each macro twice: the second run does what the first one did.
TEST_F(Isolation, SurvivesEachIntrusiveMacro) {
  for (const IntrusiveMacro& macro : ReadTables()) {
    const std::string first = Run(macro);
    ExpectRight(macro);
    if (HasFatalFailure()) return;
    if (macro.Has(">")) EXPECT_EQ(macro.directive.substr(2), first) << macro.place;
    if (macro.Has("once") || macro.Has("interrupt")) continue;
    EXPECT_EQ(first, Run(macro)) << macro.place << "\n" << macro.text;
  }
}

// SCRIPTRUBY_TORTURE=1 for the whole length.
TEST_F(Isolation, SurvivesManyMixedMacros) {
  const std::vector<IntrusiveMacro> macros = ReadTables();
  const size_t runs = std::getenv("SCRIPTRUBY_TORTURE") ? 10000 : 40;
  std::mt19937 random(Seed());
  Resources early = {};
  for (size_t run = 0; run < runs; ++run) {
    const IntrusiveMacro& macro = macros[random() % macros.size()];
    Run(macro);
    ExpectRight(macro);
    if (HasFatalFailure()) return;
    if (run == runs / 10) early = UsedNow();
  }
  const Resources late = UsedNow();
  std::printf("figure: %zu engines with macros of %zu kinds, a right one after each, no failure\n",
              runs, macros.size());
  std::printf("figure: %u KiB and %u handles after a tenth, %u KiB and %u handles at the end\n",
              early.kilobytes, early.handles, late.kilobytes, late.handles);
  EXPECT_LE(late.handles, early.handles + 8);
  if (runs >= 10000) EXPECT_LE(late.kilobytes, early.kilobytes + early.kilobytes / 20 + 2048);
}
