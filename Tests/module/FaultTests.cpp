// SPDX-License-Identifier: MIT
// Faults of every kind, inside a macro function of the host and inside the engine: the run ends
// with -1 and the message, and the next run is as if nothing had been.
#include "ModuleTest.h"

class FaultTest : public ModuleTest {};

namespace {
volatile int sink;

void ReadNothing() { sink = *reinterpret_cast<volatile int*>(8); }
void WriteNothing() { *reinterpret_cast<volatile int*>(8) = 1; }
void ExecuteData() {
  static unsigned char data[16] = {0xC3};
  reinterpret_cast<void (*)()>(reinterpret_cast<void*>(data))();
}
void DivideByZero() { __asm__ volatile("idivl %0" ::"r"(0), "a"(1), "d"(0)); }
void IllegalInstruction() { __asm__ volatile("ud2"); }
void LanguageException() { RaiseException(0xE06D7363, EXCEPTION_NONCONTINUABLE, 0, nullptr); }
__attribute__((noinline)) void OverflowStack() {
  volatile char page[4096];
  page[0] = 1;
  if (page[0] == 1) OverflowStack();
  sink = page[0];
}
void (*const kFaults[])() = {ReadNothing,        WriteNothing,      ExecuteData,  DivideByZero,
                             IllegalInstruction, LanguageException, OverflowStack};
}  // namespace

TEST_F(FaultTest, EveryKindInTheHostAndInTheEngine) {
  const char* repeats = std::getenv("SCRIPTRUBY_TEST_FAULTS");
  for (const auto& fault : kFaults)
    for (bool inHost : {true, false}) {
      Log("--- fault " + std::to_string(&fault - kFaults) +
          (inHost ? " in the host" : " in the engine"));
      for (int i = repeats ? std::atoi(repeats) : 1000; i-- > 0;) {
        muted = i > 0;  // the last one is logged
        plan.onConnect = [&](FakeEngine& engine) {
          if (!inHost) fault();
          engine.Call(L"f", {Value(VT_I4, 1)});
        };
        host.onCall = [&] {
          host.AnswerTexts({"text"});
          fault();
        };
        liveEngines = 0;
        ASSERT_EQ(-1, Run()) << i;
        ASSERT_TRUE(host.IsClean());
        ASSERT_FALSE(Module().kill(0)) << "the host is no longer current";
      }
      plan.onConnect = [&](FakeEngine& engine) { engine.Call(L"f"); };
      host.onCall = nullptr;
      liveEngines = 0;
      ASSERT_EQ(1, Run());
    }
}

// Where the script is parsed, before there is an engine, and in the clean-up itself.
TEST_F(FaultTest, OutsideTheScript) {
  plan.onParse = [](FakeEngine&) { WriteNothing(); };
  Run();
  host.noContext = true;
  const std::string path = "C:\\" + std::string(5000, 'x');  // cut where the message is full
  Execute(path);
  host.noContext = false;
  EXPECT_EQ(-1, Module().execute(reinterpret_cast<const char*>(8), host.Interface()));

  static void* brokenTable[] = {reinterpret_cast<void*>(&ExecuteData)};
  static void** broken[] = {brokenTable, brokenTable};
  plan.onParse = nullptr;
  plan.onConnect = [&](FakeEngine& engine) { engine.Call(L"f", {Value(VT_I4, 1)}); };
  host.onCall = [&] {
    host.AnswerTexts({"a", "b", "c"});
    for (int i = 0; i < 2; ++i) host.Field<void**>(31 + 16)[i + 1] = &broken[i];
    RawHost::liveTexts -= 2;
  };
  Run();
  void* const items = host.Field<void*>(51 + 16);
  host.onCall = [&] { host.Field<int>(51 + 16) = 8; };
  Run();
  host.Field<void*>(51 + 16) = items;
}

// A run that is over, or has faulted, cannot be stopped any more.
TEST_F(FaultTest, StopsThatComeTooLate) {
  void* engine = nullptr;
  plan.onConnect = [&](FakeEngine& script) {
    engine = host.Engine();
    script.Call(L"f");
  };
  host.onText = [&](const std::string& text) {
    if (text == "Destroying macro interface" || text.starts_with("Tarn has")) Stop(engine);
  };
  Run();
  host.onCall = WriteNothing;
  Run();
}

TEST_F(FaultTest, InANestedRun) {
  bool inner = false;
  plan.onConnect = [&](FakeEngine& engine) { engine.Call(L"f"); };
  host.onCall = [&] {
    void* engine = host.Engine();
    if (inner) WriteNothing();
    inner = true;
    Execute(MacroPath());
    Stop(engine);  // must reach the outer run, not the faulted one's frame
  };
  Run();
}
