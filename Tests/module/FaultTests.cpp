// SPDX-License-Identifier: MIT
// Faults of every kind, inside a macro function of the host and inside the engine: the run ends with
// -1 and the message, and the next run is as if nothing had been.
#include <cstdlib>

#include "ModuleTest.h"

class FaultTest : public ModuleTest {
 protected:
  static int Repeats() {
    const char* text = std::getenv("SCRIPTRUBY_TEST_FAULTS");
    return text ? std::atoi(text) : 1000;
  }
  Strings Message() { return {std::string(kFaultMessage) + MacroPath() + "\n"}; }
};

namespace {
volatile int sink;

void ReadNothing() { sink = *reinterpret_cast<volatile int*>(8); }
void WriteNothing() { *reinterpret_cast<volatile int*>(8) = 1; }
void ExecuteData() {
  static unsigned char data[16] = {0xC3};
  reinterpret_cast<void (*)()>(reinterpret_cast<void*>(data))();
}
void DivideByZero() {
  __asm__ volatile("idivl %0" ::"r"(0), "a"(1), "d"(0));
}
void IllegalInstruction() { __asm__ volatile("ud2"); }
void LanguageException() { RaiseException(0xE06D7363, EXCEPTION_NONCONTINUABLE, 0, nullptr); }
__attribute__((noinline)) void OverflowStack() {
  volatile char page[4096];
  page[0] = 1;
  if (page[0] == 1) OverflowStack();
  sink = page[0];
}

const struct {
  const char* name;
  void (*raise)();
} kFaults[] = {{"read", ReadNothing},
               {"write", WriteNothing},
               {"execute", ExecuteData},
               {"division", DivideByZero},
               {"instruction", IllegalInstruction},
               {"language exception", LanguageException},
               {"stack overflow", OverflowStack}};
}  // namespace

TEST_F(FaultTest, EveryKindInTheHostAndInTheEngine) {
  for (const auto& fault : kFaults) {
    for (bool inHost : {true, false}) {
      SCOPED_TRACE(std::string(fault.name) + (inHost ? " in the host" : " in the engine"));
      const auto play = [&](bool faulty) {
        plan.onConnect = [&, faulty](FakeEngine& engine) {
          if (!inHost && faulty) fault.raise();
          engine.Call(L"f", {Integer(1)});
        };
        host.onCall = [&, faulty](unsigned) {
          host.AnswerTexts({"text"});
          if (faulty) fault.raise();
        };
        return Run();
      };
      for (int i = 0; i < Repeats(); ++i) {
        host.reports.clear();
        ASSERT_EQ(-1, play(true)) << i;
        ASSERT_EQ(Message(), host.reports);
        ASSERT_TRUE(host.IsClean());
        ASSERT_FALSE(Module().kill(0)) << "the host is no longer current";
        plan.log.clear();
        host.traces.clear();
      }
      EXPECT_EQ(1, play(false));
      EXPECT_EQ("Destroying macro interface", host.traces.back());
    }
  }
}

// Where the script is parsed, where the engine is closed, and where the clean-up itself faults.
TEST_F(FaultTest, OutsideTheScript) {
  plan.onParse = [](FakeEngine&) { WriteNothing(); };
  EXPECT_EQ(-1, Run());
  plan = EnginePlan();
  host.noContext = true;
  EXPECT_EQ(-1, Run());
  host.noContext = false;
  EXPECT_EQ((Strings{Message()[0], Message()[0]}), host.reports);

  static void* brokenTable[] = {reinterpret_cast<void*>(&ExecuteData)};
  static void** broken[3] = {brokenTable, brokenTable, brokenTable};
  host.reports.clear();
  plan.onConnect = [&](FakeEngine& engine) { engine.Call(L"f"); };
  host.onCall = [&](unsigned) {
    host.AnswerTexts({"a", "b", "c"});
    for (int i = 0; i < 2; ++i) {
      RawHost::liveTexts -= 1;
      host.Field<void***>(31 + 16)[i] = reinterpret_cast<void**>(&broken[i]);
    }
  };
  EXPECT_EQ(-1, Run()) << "elements that cannot be deleted";
  EXPECT_EQ(Message(), host.reports);
}

TEST_F(FaultTest, InANestedRun) {
  bool inner = false;
  plan.onConnect = [&](FakeEngine& engine) { engine.Call(L"f"); };
  host.onCall = [&](unsigned) {
    void* engine = host.Engine();
    if (inner) WriteNothing();
    inner = true;
    EXPECT_EQ(0, Module().execute("missing.rbs", host.Interface()));
    EXPECT_EQ(-1, Module().execute(MacroPath().c_str(), host.Interface()));
    inner = false;
    RawEngine::Stop(engine);  // must reach the outer run, not a faulted one's frame
  };
  EXPECT_EQ(-1, Run());
  EXPECT_EQ(1, std::count(host.traces.begin(), host.traces.end(), "stop_macro"));
}

TEST_F(FaultTest, APathTooLongForTheMessageIsCut) {
  host.noContext = true;  // faults before any file is opened
  const std::string path = "C:\\" + std::string(5000, 'x');
  EXPECT_EQ(-1, Module().execute(path.c_str(), host.Interface()));
  EXPECT_EQ(Strings{(kFaultMessage + path).substr(0, 4095)}, host.reports);
  host.noContext = false;
}
