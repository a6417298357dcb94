// SPDX-License-Identifier: MIT
// One run from the host's call to its return: arguments, the order of events, results, failing
// steps, stops, kill and the engine's table of operations.
#include <thread>

#include "ModuleTest.h"

class RunTest : public ModuleTest {};

TEST_F(RunTest, InOrder) {
  plan.onConnect = [&](FakeEngine& engine) { engine.Call(L"f", {Value(VT_I4, 1)}); };
  Run("abc\xE9\r\n");
  EXPECT_EQ(L"abc\u00E9\r\n", plan.source);
  EXPECT_EQ(0, host.context[8]) << "the site flag";
}

TEST_F(RunTest, MissingArguments) {
  EXPECT_EQ(-1, Module().execute(MacroPath().c_str(), nullptr));
  EXPECT_EQ(-1, Module().execute(nullptr, nullptr));
  EXPECT_EQ(-1, Module().execute(nullptr, host.Interface()));
  EXPECT_EQ(0xEE, host.context[8]) << "the record is not touched";
}

TEST_F(RunTest, StepsThatFail) {
  for (const char* step :
       {"CreateInstance", "QueryInterface of the parser", "SetScriptSite", "InitNew",
        "AddNamedItem tarn 2", "ParseScriptText", "SetScriptState 2", "SetScriptState 4"})
    for (HRESULT result : {E_ACCESSDENIED, S_FALSE}) {
      Log(std::string("--- ") + step + " answers " + Hex(result));
      plan.results = {{step, result}};
      Run();
    }
}

TEST_F(RunTest, EnginesThatAreNotThere) {
  for (const char* line :
       {"", "Language=rubyscript", "Language=NoSuchEngine123456789", "Language="}) {
    Describe(line);
    Run();
  }
}

// Depth 3; level `stopAt` stops its run before the inner run, or levels 3 to 5 after it.
TEST_F(RunTest, StopsUnwindToTheInnermostRun) {
  for (int stopAt = 0; stopAt < 6; ++stopAt) {
    Log("--- stop " + std::to_string(stopAt));
    int depth = 0;
    plan.onConnect = [&](FakeEngine& engine) { engine.Call(L"f"); };
    host.onCall = [&] {
      void* engine = host.Engine();
      const int level = depth++;
      if (stopAt == level) Stop(engine);
      if (level < 2) Execute(MacroPath());
      host.Field<void*>(18) = engine;  // the nested run on the same record has cleared it
      if (stopAt == 5 - level) Stop(engine);
    };
    liveEngines = 0;
    Run();
  }
}

// A stop ends the innermost run, whichever engine it names; the outer run then ends as usual.
TEST_F(RunTest, TheOuterEngineStoppedInANestedRun) {
  void* outer = nullptr;
  plan.onConnect = [&](FakeEngine& engine) { engine.Call(L"f"); };
  host.onCall = [&] {
    if (outer) Stop(outer);
    outer = host.Engine();
    Execute(MacroPath());
  };
  Run();
}

TEST_F(RunTest, AThousandStops) {
  muted = true;
  plan.onConnect = [&](FakeEngine& engine) { engine.Call(L"f"); };
  host.onCall = [&] {
    host.AnswerTexts({"never returned"});
    Stop(host.Engine());
  };
  for (int i = 0; i < 1000; ++i) ASSERT_EQ(-1, Run()) << i;
  muted = false;
  host.onCall = nullptr;
  liveEngines = 0;
  Run();
}

TEST_F(RunTest, KillFlagsOnlyARunningMacro) {
  EXPECT_FALSE(Module().kill(5));
  plan.onConnect = [&](FakeEngine&) {
    EXPECT_TRUE(Module().kill(-7));
    EXPECT_EQ(1, host.context[9]);
    EXPECT_EQ(-7, host.Field<int>(10));
    EXPECT_EQ(0, host.Field<int>(14)) << "nothing behind the value";
    bool fromThread = false;
    std::thread([&] { fromThread = Module().kill(8); }).join();
    EXPECT_TRUE(fromThread);
    host.noContext = true;
    EXPECT_FALSE(Module().kill(9));
    host.noContext = false;
  };
  Run();
  EXPECT_FALSE(Module().kill(5));
  EXPECT_EQ(8, host.Field<int>(10));
}

TEST_F(RunTest, TheEngineTable) {
  plan.onConnect = [&](FakeEngine&) {
    void* engine = host.Engine();
    unsigned char record[392] = {};
    EXPECT_EQ(2000u, CallSlot<unsigned>(engine, 0, "f")) << "functions are the host's";
    CallSlot<void>(engine, 2);
    EXPECT_EQ(-1, CallSlot<int>(engine, 4, static_cast<const char*>(nullptr)));
    EXPECT_TRUE(CallSlot<bool>(engine, 5, record, ""));
    EXPECT_STREQ("FakeEngine WSH Version 1.50", reinterpret_cast<char*>(record + 8));
    EXPECT_FALSE(CallSlot<bool>(engine, 5, static_cast<void*>(nullptr), ""));
  };
  Run();
}

TEST_F(RunTest, NestedRunsRestoreTheirCaller) {
  RawHost inner;
  bool nested = false;
  plan.onConnect = [&](FakeEngine& engine) {
    if (nested) return;
    nested = true;
    EXPECT_EQ(1, Module().execute(MacroPath().c_str(), inner.Interface()));
    EXPECT_TRUE(inner.IsClean());
    EXPECT_NE(nullptr, host.Engine()) << "another host's record is its own";
    engine.Call(L"f");
  };
  Run();
}

TEST_F(RunTest, MacroFiles) {
  const std::string locked = TestFolder() + "\\locked.rbs";
  WriteBytes(locked, "x");
  HANDLE lock = CreateFileA(locked.c_str(), GENERIC_READ | GENERIC_WRITE, 0, nullptr, OPEN_EXISTING,
                            0, nullptr);
  for (const std::string& path :
       {TestFolder() + "\\missing.rbs", TestFolder(), locked, std::string(),
        "C:\\" + std::string(5000, 'x'), std::string("%s%n*?")})
    EXPECT_EQ(0, Execute(path)) << path;
  CloseHandle(lock);

  std::string bytes;
  for (int i = 255; i >= 0; --i) bytes += static_cast<char>(i);
  for (const std::string& macro :
       {std::string(), std::string(1000, '\0'), bytes, std::string(50 * 1024 * 1024, 'x')}) {
    EXPECT_EQ(1, Run(macro));
    // Byte for byte up to the first NUL, as the C runtime's plain locale has it.
    std::wstring expected;
    for (unsigned char byte : macro.substr(0, macro.find('\0'))) expected += byte;
    EXPECT_TRUE(expected == plan.source);
  }
}
