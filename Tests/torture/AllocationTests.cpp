// SPDX-License-Identifier: MIT
// Each request for memory of a run fails in turn: there is no crash and no leak, the host's record is
// clean, and the next run is right.
#include <process.h>

#include <cstdlib>

#include "Imports.h"
#include "TortureTest.h"

class AllocationTest : public TortureTest {
 protected:
  using TortureTest::TortureTest;

  // Does `action` with one request more that succeeds each time, until none of them fails.
  // An action of the Ruby engine leaves blocks to its collector.
  void FailEach(HMODULE module, const char* what, const std::function<void()>& action) {
    WatchMemory(module);
    bool failed = true;
    int n = 0;
    for (; failed && !HasFatalFailure(); ++n) {
      SCOPED_TRACE(what + " without the request "s + std::to_string(n + 1));
      const int before = LiveBlocks();
      FailRequest(n + 1);
      action();
      failed = FailRequest(0);
      EXPECT_TRUE(host.IsClean());
      ExpectRightRun();
      if (module == dll) EXPECT_EQ(before, LiveBlocks());
    }
    Figure("%s: each of %d requests for memory has failed once", what, n - 1);
    EXPECT_GT(n, 5);
  }
};

TEST_F(AllocationTest, OfARunInTheModule) {
  // Every kind of argument, a list that has to grow, a text result, reports of errors.
  bool called = false;
  const auto call = [&](const std::vector<VARIANT>& arguments) {
    called = false;
    const HRESULT answer = Call(L"f", arguments);
    EXPECT_EQ(called ? S_OK : E_OUTOFMEMORY, answer);
  };
  on["engine: SetScriptState 2"] = [&] {
    EXPECT_TRUE(source == L"\n") << "not the macro file's text";
    const VARIANT values[] = {Value(VT_I4, 1), Value(VT_R8, 2.5), Value(VT_BOOL, 1),
                              Value(VT_BSTR, SysAllocString(L"text"))};
    call({values, values + 4});
    call(std::vector<VARIANT>(51, Value(VT_I4, 1)));
    Call(L"unknown");
    IErrorInfo* error = nullptr;
    IDispatch* const tarn = Item();
    void** const slots = *reinterpret_cast<void***>(tarn);
    reinterpret_cast<HRESULT(__stdcall*)(void*)>(slots[9])(tarn);
    if (GetErrorInfo(0, &error) == S_OK) error->Release();
  };
  on["call 7"] = [&] {
    called = true;
    const int arguments = At<int>(host.context, 51 + 8);
    EXPECT_TRUE(arguments == 4 || arguments == 51) << "a call without all arguments";
    host.AnswerTexts({std::string(500, 'y'), "z"});
  };
  FailEach(dll, "a run", [&] {
    At<unsigned>(host.context, 51 + 4) = 1;  // the list of arguments has to grow again
    Describe("Language=JScript\r\nMacroBegin=" + std::string(400, 'x'));
    EXPECT_LE(std::abs(Run()), 1);
  });
  for (const char* report : {"No memory for the macro engine", "No memory for the script site"})
    EXPECT_NE(std::string::npos, ModuleLog().find(report)) << report;
  for (const char* step : {"AddNamedItem tarn 2", "ParseScriptText", "SetScriptState 2"}) {
    FailEach(dll, step, [&] {
      results = {{step, E_FAIL}};
      textsFreed = 0, source.clear();
      Run();
      EXPECT_EQ(step == "ParseScriptText"s && !source.empty() ? 3 : 0, textsFreed);
      results.clear();
    });
  }
}

TEST_F(AllocationTest, OfVersion) {
  const auto fill = [] {
    char record[392] = {'\x88', 1};  // its size
    return CallExport<bool>(dll, "version", &record[0], "C:\\windows\\temp\\torture");
  };
  FailEach(dll, "version", [&] {
    Describe("Language=JScript\r\nMacroEnd=a\\nb\r\n" + std::string(3000, 'x'));
    fill();
  });
  FailRequest(1);
  EXPECT_FALSE(fill()) << "without the macro engine";
  EXPECT_TRUE(FailRequest(0) && fill());
}

class RubyAllocationTest : public AllocationTest {
 protected:
  RubyAllocationTest() : AllocationTest((ActivateRuby(), ""), "@tarn.f(1)\n") {}
};

// Not the interpreter's own: a request that fails there is tried again.
TEST_F(RubyAllocationTest, OfARunInTheEngine) {
  on["call 7"] = [&] { host.AnswerTexts({"t\xC3\xA4xt"}); };
  const std::pair<const char*, const char*> macros[] = {
      {"a Ruby macro with calls",
       "@tarn.f(1, 2.5, 'text', :symbol, 2**70, nil, true, [1, ['x']])\n@tarn.g('x' * 300, "
       "*1..20)\n"},
      {"a Ruby macro with an error", "Thread.new { 1 }.join\ndef x = 1\nraise 'message'\n"},
      {"a wrong Ruby macro", "x = = 1\n"},
      {"a Ruby macro with an unknown name", "@tarn.unknown(1)\n"}};
  for (const auto& [name, macro] : macros)
    FailEach(GetModuleHandleA("rubyscript.dll"), name, [&] {
      WriteBytes(macroPath, macro);
      Run();
    });
}

// The first run of a process starts the interpreter, so each request needs a new process: this test
// starts itself again.
class FirstRunAllocationTest : public TortureTest {
 protected:
  // Names, in the environment of such a process, a file with the number of the request. The process
  // removes the file when that request has failed.
  static constexpr char kRequestFile[] = "SCRIPTRUBY_TORTURE_REQUEST";

  void FailOneRequest(const std::string& file) {
    int n = 0;
    std::ifstream(file) >> n;
    ActivateRuby();
    // COM, which asks for the same file, gets this one.
    const HMODULE engine = LoadLibraryExA(RUBY_ENGINE, nullptr, LOAD_WITH_ALTERED_SEARCH_PATH);
    ASSERT_TRUE(engine);
    WatchMemory(engine);
    int calls = 0;
    on["call 7"] = [&] { ++calls; };
    Describe(""), WriteBytes(macroPath, "@tarn.f(1)\n");
    FailRequest(n);
    const int result = Run();
    if (FailRequest(0)) std::filesystem::remove(file);
    EXPECT_EQ(calls, result == 1);
    EXPECT_TRUE(host.IsClean());
    EXPECT_EQ(1, Run()) << "the next one";
  }
};

TEST_F(FirstRunAllocationTest, OfTheEngine) {
  const char* const given = std::getenv(kRequestFile);
  if (given) return FailOneRequest(given);
  char program[MAX_PATH] = "";
  GetModuleFileNameA(nullptr, program, MAX_PATH);
  const std::string file = testFolder + "\\request";
  SetEnvironmentVariableA(kRequestFile, file.c_str());
  const unsigned step = Rounds(1, 4);
  int requests = 0;
  bool failed = true;
  for (unsigned n = 1 + Below(step); failed && !HasFailure(); n += step) {
    SCOPED_TRACE("without the request " + std::to_string(n));
    WriteBytes(file, std::to_string(n));
    EXPECT_EQ(
        0, _spawnl(_P_WAIT, program, program, "--gtest_filter=FirstRunAllocationTest.*", nullptr));
    failed = !std::filesystem::exists(file);
    requests += failed;
  }
  SetEnvironmentVariableA(kRequestFile, nullptr);
  Figure("a first Ruby macro: %s of its requests for memory has failed once (%d)",
         step == 1 ? "each" : "one in four", requests);
  EXPECT_GT(requests, 2);
}
