// SPDX-License-Identifier: MIT
// One run from the host's call to its return: arguments, the order of events, results, failing
// steps, stops, kill and the engine's table of operations.
#include <filesystem>
#include <thread>

#include "ModuleTest.h"

class ExecuteTest : public ModuleTest {};

static const Strings kCreation = {"QueryParse", "SetScriptSite", "InitNew", "AddNamedItem tarn 2"};

static Strings Joined(Strings first, const Strings& second) {
  first.insert(first.end(), second.begin(), second.end());
  return first;
}

static std::string SystemText(HRESULT result) {
  char text[2048] = "";
  FormatMessageA(FORMAT_MESSAGE_FROM_SYSTEM, nullptr, result, 0, text, sizeof text, nullptr);
  return *text ? std::string("\nReason: ") + text : "";
}

TEST_F(ExecuteTest, MissingArguments) {
  EXPECT_EQ(-1, Module().execute("C:\\none.rbs", nullptr));
  EXPECT_EQ(-1, Module().execute(nullptr, nullptr));
  host.Field<int>(10) = 99;
  EXPECT_EQ(-1, Module().execute(nullptr, host.Interface()));
  EXPECT_EQ(Strings{"Unexpected internal macro execute error!"}, host.reports);
  EXPECT_EQ(99, host.Field<int>(10));
  EXPECT_EQ(0xEE, host.Field<unsigned char>(8)) << "the record is not touched";
}

TEST_F(ExecuteTest, ARunInOrder) {
  plan.onConnect = [&](FakeEngine& engine) {
    EXPECT_NE(nullptr, host.Engine());
    VARIANT result = {};
    EXPECT_EQ(S_OK, engine.Call(L"f", {Integer(1)}, &result));
    EXPECT_EQ(VT_I4, result.vt);
  };
  EXPECT_EQ(1, Run("abc\xE9\r\n"));
  EXPECT_EQ(Joined(kCreation, {"ParseScriptText", "SetScriptState 2", "SetScriptState 4"}), plan.log);
  EXPECT_EQ(L"abc\u00E9\r\n", plan.source);
  EXPECT_EQ((Strings{"crlf 1", "delimiter 0", "call 7"}), host.calls);
  EXPECT_EQ((Strings{"Initialising macro interface", "The Tarn object was requested and returned.",
                     "GetIDsOfNames call succeeded.", "Script object destroyed.",
                     "Destroying macro interface"}),
            host.traces);
  EXPECT_EQ(Strings{}, host.reports);
  EXPECT_EQ(0, host.Field<unsigned char>(8)) << "the site flag";
  EXPECT_EQ(0, plan.liveEngines);
}

TEST_F(ExecuteTest, AFailingCreationStepEndsTheChain) {
  const struct {
    const char* step;
    size_t steps;  // of kCreation that the site still makes
  } kSteps[] = {{"CreateInstance", 0}, {"QueryParse", 1},          {"SetScriptSite", 2},
                {"InitNew", 3},        {"AddNamedItem tarn 2", 4}};
  const std::string advice =
      "Unexpected error creating 'FakeEngine' COM object.\n\nMake sure the FakeEngine Windows "
      "Scripting Host has been correctly installed.\n\n   Windows Scripting Host: "
      "https://tarn.example/download/windows-script-host\n";
  for (const auto& failing : kSteps) {
    SCOPED_TRACE(failing.step);
    plan = EnginePlan();
    host.Reset();
    plan.results[failing.step] = E_ACCESSDENIED;
    EXPECT_EQ(-1, Run());
    Strings expected(kCreation.begin(), kCreation.begin() + failing.steps);
    if (failing.steps > 0) expected.push_back("SetScriptState 4");
    EXPECT_EQ(expected, plan.log);
    EXPECT_EQ(Strings{"\n\nError creating 'FakeEngine' scripting module." +
                      SystemText(E_ACCESSDENIED) + advice},
              host.reports);
    EXPECT_EQ("Destroying macro interface", host.traces.back());
    EXPECT_EQ(0, plan.liveEngines);
  }
  plan = EnginePlan();
  plan.results["InitNew"] = S_FALSE;  // a success code goes on
  EXPECT_EQ(1, Run());
}

TEST_F(ExecuteTest, EnginesThatAreNotThere) {
  const std::string longName = "NoSuchEngine" + std::string(6, '0');  // as long as a name may be
  const struct {
    std::string description;
    std::string name;
    const char* ruby;
  } kCases[] = {{"", "RubyScript", "\n               RubyScript: https://tarn.example/download/rubyscript"},
                {"Language=" + longName + "cut\r\n", longName, ""},
                {"Language=rubyscript\r\n", "rubyscript", ""}};
  for (const auto& missing : kCases) {
    host.Reset();
    Describe("[Options]\r\n" + missing.description);
    EXPECT_EQ(-1, Run());
    EXPECT_EQ(Strings{"\n\nError creating '" + missing.name + "' scripting module." +
                      SystemText(static_cast<HRESULT>(0x800401F3)) + "Unexpected error creating '" + missing.name +
                      "' COM object.\n\nMake sure the " + missing.name +
                      " Windows Scripting Host has been correctly installed.\n" + missing.ruby +
                      "\n   Windows Scripting Host: https://tarn.example/download/"
                      "windows-script-host\n"},
              host.reports);
  }
  host.Reset();
  Describe("[Options]\r\nLanguage=\r\n");
  EXPECT_EQ(-1, Run());
  EXPECT_EQ(Strings{"No scripting module provided."}, host.reports);
  EXPECT_EQ(Strings{}, plan.log);
}

TEST_F(ExecuteTest, ParseAndRunResults) {
  const struct {
    const char* step;
    HRESULT result;
    const char* report;
  } kCases[] = {{"ParseScriptText", E_FAIL, "\nError parsing '"},
                {"ParseScriptText", S_FALSE, "\nError parsing '"},
                {"SetScriptState 2", static_cast<HRESULT>(0x80020101), "\nError executing '"},
                {"SetScriptState 2", S_FALSE, "\nError executing '"}};
  for (const auto& failing : kCases) {
    plan = EnginePlan();
    host.Reset();
    plan.results[failing.step] = failing.result;
    EXPECT_EQ(0, Run());
    EXPECT_EQ(Strings{failing.report + MacroPath() + "' macro script." + SystemText(failing.result)},
              host.reports);
    EXPECT_EQ(0, plan.liveEngines);
  }
  plan = EnginePlan();
  plan.results["SetScriptState 4"] = E_FAIL;  // nobody asks what closing answers
  EXPECT_EQ(1, Run());
}

TEST_F(ExecuteTest, StopUnwindsToTheInnermostRun) {
  // Depth 3; at `stopAt` the macro function stops its run, before or after the inner run.
  for (int stopAt = 0; stopAt < 6; ++stopAt) {
    SCOPED_TRACE(stopAt);
    plan = EnginePlan();
    host.Reset();
    int depth = 0;
    std::vector<int> results;
    plan.onConnect = [&](FakeEngine& engine) { engine.Call(L"f"); };
    host.onCall = [&](unsigned) {
      void* engine = host.Engine();
      const int level = depth++;
      if (stopAt == level) RawEngine::Stop(engine);
      if (level < 2) results.push_back(Module().execute(MacroPath().c_str(), host.Interface()));
      host.Field<void*>(18) = engine;  // a nested run on the same record has cleared it
      if (stopAt == 5 - level) RawEngine::Stop(engine);
    };
    results.push_back(Run());
    // The inner runs end first; only the stopped one answers -1.
    const std::vector<std::vector<int>> kExpected = {{-1}, {-1, 1}, {-1, 1, 1}, {-1, 1, 1}, {1, -1, 1}, {1, 1, -1}};
    EXPECT_EQ(kExpected[stopAt], results);
    EXPECT_EQ(1, std::count(plan.log.begin(), plan.log.end(), "Interrupt -3 0"));
    EXPECT_EQ(1, std::count(host.traces.begin(), host.traces.end(), "stop_macro"));
    EXPECT_EQ("Destroying macro interface", host.traces.back());
    EXPECT_EQ(Strings{}, host.reports);
    EXPECT_EQ(1, plan.liveEngines) << "only the stopped engine is abandoned";
  }
}

TEST_F(ExecuteTest, AThousandStops) {
  plan.onConnect = [&](FakeEngine& engine) { engine.Call(L"f"); };
  host.onCall = [&](unsigned) {
    host.AnswerTexts({"never returned"});
    RawEngine::Stop(host.Engine());
  };
  for (int i = 0; i < 1000; ++i) ASSERT_EQ(-1, Run()) << i;
  EXPECT_TRUE(host.IsClean());
  host.onCall = nullptr;
  EXPECT_EQ(1, Run());
}

TEST_F(ExecuteTest, KillFlagsOnlyARunningMacro) {
  EXPECT_FALSE(Module().kill(5));
  plan.onConnect = [&](FakeEngine&) {
    bool fromThread = false;
    EXPECT_TRUE(Module().kill(-7));
    EXPECT_EQ(1, host.Field<unsigned char>(9));
    EXPECT_EQ(-7, host.Field<int>(10));
    std::thread([&] { fromThread = Module().kill(8); }).join();
    EXPECT_TRUE(fromThread);
    EXPECT_EQ(8, host.Field<int>(10));
    EXPECT_EQ(0, host.Field<int>(14)) << "nothing behind the value";
    host.noContext = true;
    EXPECT_FALSE(Module().kill(9));
    host.noContext = false;
  };
  EXPECT_EQ(1, Run());
  EXPECT_FALSE(Module().kill(5));
  EXPECT_EQ(8, host.Field<int>(10));
}

TEST_F(ExecuteTest, TheEngineTable) {
  plan.onConnect = [&](FakeEngine&) {
    void* engine = host.Engine();
    EXPECT_EQ(2000u, RawEngine::FunctionId(engine, "f")) << "functions are the host's";
    host.traces.clear();
    RawEngine::Initialise(engine);
    EXPECT_EQ(Strings{"Initialising macro interface"}, host.traces);
    EXPECT_EQ(-1, RawEngine::Run(engine, nullptr));
    EXPECT_EQ(1u, plan.log.size() - 5) << "no second site";
    unsigned char record[392] = {};
    EXPECT_TRUE(RawEngine::FillVersion(engine, record, nullptr));
    EXPECT_STREQ("FakeEngine WSH Version 1.50", reinterpret_cast<char*>(record + 8));
    EXPECT_FALSE(RawEngine::FillVersion(engine, nullptr, nullptr));
  };
  EXPECT_EQ(1, Run());

  // Slot 6 without the delete flag only destroys: the memory stays and is freed by hand.
  plan.onConnect = [&](FakeEngine&) { host.Field<void*>(18) = nullptr; };
  EXPECT_EQ(1, Run());
}

TEST_F(ExecuteTest, NestedRunsRestoreTheirCaller) {
  RawHost inner;
  bool nested = false;
  plan.onConnect = [&](FakeEngine& engine) {
    if (nested) return;
    nested = true;
    EXPECT_EQ(1, Module().execute(MacroPath().c_str(), inner.Interface()));
    EXPECT_TRUE(inner.IsClean());
    EXPECT_NE(nullptr, host.Engine()) << "another host's record is its own";
    EXPECT_EQ(S_OK, engine.Call(L"f"));
  };
  EXPECT_EQ(1, Run());
  EXPECT_EQ((Strings{"crlf 1", "delimiter 0", "call 7"}), host.calls);
}

TEST_F(ExecuteTest, BadMacroFiles) {
  const std::string folder = TestFolder();
  const std::string locked = folder + "\\locked.rbs";
  WriteBytes(locked, "x");
  HANDLE lock = CreateFileA(locked.c_str(), GENERIC_READ | GENERIC_WRITE, 0, nullptr, OPEN_EXISTING, 0, nullptr);
  for (const std::string& path : {folder + "\\missing.rbs", folder, locked, std::string(),
                                  std::string("C:\\") + std::string(5000, 'x'), std::string("%s%n*?")}) {
    host.Reset();
    EXPECT_EQ(0, Module().execute(path.c_str(), host.Interface())) << path;
    EXPECT_EQ(Strings{}, host.reports);
  }
  CloseHandle(lock);

  std::string bytes(256, 0);
  for (int i = 0; i < 256; ++i) bytes[i] = static_cast<char>(255 - i);
  const std::string big(50 * 1024 * 1024, 'x');
  for (const std::string& macro : {std::string(), std::string(1000, '\0'), bytes, big}) {
    EXPECT_EQ(1, Run(macro));
    // Byte for byte up to the first NUL, as the C runtime's plain locale has it.
    std::wstring expected;
    for (unsigned char byte : macro.substr(0, macro.find('\0'))) expected += byte;
    EXPECT_TRUE(expected == plan.source);
  }
}
