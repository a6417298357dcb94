// SPDX-License-Identifier: MIT
// Faults of every kind, inside a macro function of the host and inside the engine: the run ends
// with -1 and the message, and the next run is as if nothing had been.
#include <algorithm>
#include <thread>

#include "Faults.h"
#include "ModuleTest.h"

using FaultTest = ModuleTest;

// Windows puts a guard page below the stack and removes it with an overflow; without it the next
// overflow ends the process.
static bool HasGuardPage() {
  MEMORY_BASIC_INFORMATION part;
  VirtualQuery(&part, &part, sizeof part);
  for (auto* at = static_cast<char*>(part.AllocationBase); at < reinterpret_cast<char*>(&part);
       at += part.RegionSize)
    if (VirtualQuery(at, &part, sizeof part) && (part.Protect & PAGE_GUARD)) return true;
  return false;
}

// Includes a stop: it leaves as many objects as a fault does, and must work as often.
TEST_F(FaultTest, EveryKindInTheHostAndInTheEngine) {
  std::vector<std::pair<const char*, std::function<void()>>> faults(kFaults.begin(), kFaults.end());
  faults.emplace_back("stop", [&] { Stop(host.Engine()); });
  const char* repeats = std::getenv("SCRIPTRUBY_TEST_FAULTS");
  const auto script = on["engine: SetScriptState 2"];
  std::string right;
  for (const auto& [kind, fault] : faults)
    for (bool inHost : {true, false}) {
      Log("--- "s + kind + (inHost ? " in the host" : " in the engine"));
      const auto run = [&](bool fails) {
        on["engine: SetScriptState 2"] = [&] { inHost || !fails ? script() : fault(); };
        on["call 7"] = [&] { host.AnswerTexts({"text"}), fails ? fault() : void(); };
        ASSERT_EQ(fails ? -1 : 1, Run());
        ASSERT_TRUE(HasGuardPage()) << kind;
      };
      muted = true;
      for (int i = repeats ? std::atoi(repeats) : 1000; i > 1 && !HasFailure(); --i) run(true);
      muted = false;
      run(true);
      const std::string before = std::exchange(transcript, "");
      run(false);
      if (right.empty()) right = transcript;
      EXPECT_EQ(right, std::exchange(transcript, before)) << "after " << kind;
    }
}

// Where the script is parsed, before there is an engine, and in the clean-up itself.
TEST_F(FaultTest, OutsideTheScript) {
  on["engine: ParseScriptText"] = WriteNothing;
  Run();
  host.noContext = true;
  Run("C:\\" + std::string(5000, 'x'));  // cut where the message is full
  host.noContext = false;
  EXPECT_EQ(-1, ExecuteFor(&host, reinterpret_cast<const char*>(8)));

  // Elements whose deletion faults cost only themselves, however many there are.
  void* brokenTable[] = {data};
  void** broken = brokenTable;
  on.erase("engine: ParseScriptText");
  on["call 7"] = [&] {
    for (int i = 0; i < 250; ++i) host.AnswerTexts({"good"}), host.Append(RawHost::kTexts, &broken);
  };
  Run();
  void* const items = At<void*>(host.context, 51 + 16);
  on["call 7"] = [&] { At<int>(host.context, 51 + 16) = 8; };
  Run();
  At<void*>(host.context, 51 + 16) = items;
}

namespace {
RawHost* watched;
void* THISCALL DeleteWatched(void* element, unsigned flags) {
  Log("deleted with " + std::to_string(flags) + ": " + watched->State());
  return element;
}
}  // namespace

// What a host can see of the clean-up, after a run and after a fault.
TEST_F(FaultTest, CleanUpStepByStep) {
  auto table = Table(DeleteWatched);
  void** element = table.data();
  watched = &host;
  for (bool faults : {false, true}) {
    Log(faults ? "--- after a fault" : "--- after a run");
    on["call 7"] = [&] {
      for (int list : {RawHost::kTexts, RawHost::kArguments}) host.Append(list, &element);
      if (faults) WriteNothing();
    };
    for (const char* step :
         {"engine: SetScriptState 4", "trace: Script", "trace: Destroy", "report"})
      on[step] = [&] { Log("  " + host.State() + (Kill(1) ? ", current" : "")); };
    Run();
  }
}

TEST_F(FaultTest, NothingLeavesAnExport) {
  on["report: Unexpected"] = WriteNothing;
  EXPECT_EQ(-1, ExecuteFor(&host, nullptr));
  char record[392] = {'\x88', 1};  // its size
  char* const nowhere = reinterpret_cast<char*>(8);
  EXPECT_FALSE(CallExport<bool>(dll, "version", &record[0], nowhere));
  EXPECT_FALSE(CallExport<bool>(dll, "version", nowhere, nullptr));
  // A record in which only the flag can be written: the value comes first.
  static char* const end =
      static_cast<char*>(VirtualAlloc(nullptr, 8192, MEM_RESERVE, PAGE_NOACCESS)) + 4096;
  VirtualAlloc(end - 1, 1, MEM_COMMIT, PAGE_READWRITE);
  void* table[13];
  std::copy_n(host.table, 13, table);
  struct Edge {
    static void* THISCALL Context(void*) { return end - 10; }
  };
  Script([&] {
    void** const own = std::exchange(host.table, table);
    table[1] = reinterpret_cast<void*>(Edge::Context);
    EXPECT_FALSE(Kill(5));
    EXPECT_EQ(0, end[-1]) << "flagged without the value";
    table[1] = data;  // faults itself
    EXPECT_FALSE(Kill(5));
    host.table = own;
  });
}

// A run that is over, or has faulted, or belongs to another thread, cannot be stopped.
TEST_F(FaultTest, StopsThatComeTooLateOrFromElsewhere) {
  void* engine = nullptr;
  bool faults = false;
  on["call 7"] = [&] {
    engine = host.Engine();
    if (faults) WriteNothing();
  };
  on["trace: Destroying"] = on["report: Tarn has"] = [&] { Stop(engine), Log("still here"); };
  Run();
  faults = true;
  Run();
  for (bool stops : {false, true}) {
    on["call 7"] = [&] {
      engine = host.Engine();
      std::thread([&] { Stop(engine), Log("returned on another thread"); }).join();
      if (stops) on.erase("trace: Destroying"), Stop(engine);
    };
    Run();
  }
}
