// SPDX-License-Identifier: MIT
// Faults of every kind, inside a macro function of the host and inside the engine: the run ends
// with -1 and the message, and the next run is as if nothing had been.
#include "Faults.h"
#include "ModuleTest.h"

using FaultTest = ModuleTest;

// The page that tells this thread's next overflow is gone after one, until it is made anew.
static bool HasGuardPage() {
  MEMORY_BASIC_INFORMATION part;
  VirtualQuery(&part, &part, sizeof part);
  for (auto* at = static_cast<char*>(part.AllocationBase); at < reinterpret_cast<char*>(&part);
       at += part.RegionSize)
    if (VirtualQuery(at, &part, sizeof part) && (part.Protect & PAGE_GUARD)) return true;
  return false;
}

// A stop is among them: it leaves as much behind, and must stay possible as often.
TEST_F(FaultTest, EveryKindInTheHostAndInTheEngine) {
  std::vector<std::pair<const char*, std::function<void()>>> faults(kFaults.begin(), kFaults.end());
  faults.emplace_back("stop", [&] { Stop(host.Engine()); });
  const char* repeats = std::getenv("SCRIPTRUBY_TEST_FAULTS");
  const auto script = on["engine: SetScriptState 2"];
  for (const auto& [kind, fault] : faults)
    for (bool inHost : {true, false}) {
      Log("--- "s + kind + (inHost ? " in the host" : " in the engine"));
      for (int i = repeats ? std::atoi(repeats) : 1000; i >= 0; --i) {
        muted = i > 1;  // the last one is logged, and a run without a fault
        on["engine: SetScriptState 2"] = [&] { inHost || !i ? script() : fault(); };
        on["call 7"] = [&] { host.AnswerTexts({"text"}), i ? fault() : void(); };
        ASSERT_EQ(i ? -1 : 1, Run()) << i;
        ASSERT_TRUE(HasGuardPage()) << kind;
      }
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

  void* brokenTable[] = {data};
  void** broken = brokenTable;
  on.erase("engine: ParseScriptText");
  on["call 7"] = [&] {
    host.AnswerTexts({"a", "b", "c", "d"});
    for (int i : {1, 2}) At<void**>(host.context, 31 + 16)[i] = &broken;
    liveTexts -= 2;
  };
  Run();
  void* const items = At<void*>(host.context, 51 + 16);
  on["call 7"] = [&] { At<int>(host.context, 51 + 16) = 8; };
  Run();
  At<void*>(host.context, 51 + 16) = items;
}

// A run that is over, or has faulted, cannot be stopped any more.
TEST_F(FaultTest, StopsThatComeTooLate) {
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
}
