// SPDX-License-Identifier: MIT
// One run from the host's call to its return: arguments, the order of events, results, failing
// steps, stops, kill and the engine's table of operations.
#include <algorithm>
#include <clocale>
#include <thread>

#include "ModuleTest.h"

using RunTest = ModuleTest;

TEST_F(RunTest, ArgumentsOrderKillAndTheEngineTable) {
  EXPECT_EQ(-1, ExecuteFor(nullptr, macroPath.c_str()));
  EXPECT_EQ(-1, ExecuteFor(&host, nullptr));
  EXPECT_EQ(0xEE, host.context[8]) << "the record is not touched";
  Script([&] {
    Call(L"f");
    char record[392] = {};
    void* const engine = host.Engine();
    CallSlot<void>(engine, 2);
    EXPECT_TRUE(CallSlot<unsigned>(engine, 0, "f") == 2000 &&
                CallSlot<int>(engine, 4, nullptr) == -1);
    EXPECT_TRUE(CallSlot<bool>(engine, 5, record, "") && !CallSlot<bool>(engine, 5, nullptr, ""));
    EXPECT_STREQ("JScript WSH Version 1.50", record + 8);

    std::thread([] { EXPECT_TRUE(Kill(-7)); }).join();
    host.noContext = true;
    EXPECT_FALSE(Kill(9));
    host.noContext = false;
    EXPECT_EQ("\x01\xF9\xFF\xFF\xFF\0"s, std::string(host.context + 9, host.context + 15));
  });
  EXPECT_EQ(0, host.context[8]) << "the site flag";
}

TEST_F(RunTest, StepsThatFailAndDescriptions) {
  for (const char* step :
       {"QueryInterface", "QueryInterface of the parser", "SetScriptSite", "InitNew",
        "AddNamedItem tarn 2", "ParseScriptText", "SetScriptState 2", "SetScriptState 4"})
    for (HRESULT result : {E_ACCESSDENIED, S_FALSE}) {
      Log("--- "s + step + " answers " + Hex(result));
      results = {{step, result}}, Run();
    }
  results = {{"SetScriptState 2", HRESULT_FROM_WIN32(ERROR_BAD_EXE_FORMAT)}};
  Log("--- a reason that wants a name"), Run();
  results.clear();
  const std::string js = "Language=JScript\r\n";
  for (const std::string& lines :
       {""s, "Language=rubyscript"s, "Language=NoSuchEngine123456789"s, "Language="s,
        js + "NoCase=1", js + "FixCRLF=yes\r\nFixDelimiter=-1", js + "FixCRLF=1\r\nFixDelimiter=0"})
    Describe(lines), Run();
  // A thread on which the host has not initialised COM is left so: its apartment is still open.
  std::thread([&] {
    Describe("Language=NoSuchEngine"), Run();
    EXPECT_EQ(S_OK, CoInitializeEx(nullptr, COINIT_MULTITHREADED));
    CoUninitialize();
  }).join();
}

// Three levels. Each stop is called by one of them, before its inner run (0, 1, 2) or after it (3:
// naming the outermost engine, 4, 5, 6: when that has faulted), and ends its own run only.
TEST_F(RunTest, StopsUnwindToTheInnermostRun) {
  for (size_t stop = 0; stop < 7; ++stop) {
    Log("--- stop " + std::to_string(stop));
    std::vector<void*> engines;
    on["call 7"] = [&] {
      const size_t level = engines.size();
      engines.push_back(host.Engine());
      if (stop == level) Stop(engines[level]);
      if (stop == 6 && level == 2) RaiseException(EXCEPTION_ACCESS_VIOLATION, 0, 0, nullptr);
      if (level < 2) Run();
      host.Engine() = engines[level];  // the nested run on the same record has cleared it
      if (stop == 5 - level || stop == 5 + level) Stop(engines[stop == 3 ? 0 : level]);
    };
    Run();
  }
}

// While the site is made, while it runs and while it goes; the next run is right.
TEST_F(RunTest, StopsAroundTheScript) {
  for (const char* step : {"engine: SetScriptSite", "engine: ParseScriptText",
                           "engine: SetScriptState 4", "trace: Script object"}) {
    Log("--- at "s + step);
    on[step] = [&] { Stop(host.Engine()); };
    Run();
    on.erase(step);
    muted = true;
    EXPECT_EQ(1, Run());
    muted = false;
  }
}

// The `tarn` of one host's run, used there, inside of another host's run and after a stop: it traces
// and reports to the host that it was made for, and asks and calls the current one.
TEST_F(RunTest, NestedRunsAndTheirHosts) {
  RawHost inner(" [inner]");
  host.name = " [outer]";
  IDispatch* tarn = nullptr;
  const auto use = [&](const char* when) {
    Log("--- the outer tarn "s + when);
    std::wstring known = L"g", unknown = L"unknown";
    LPOLESTR names[] = {known.data(), unknown.data()};
    DISPID ids[2];
    DISPPARAMS none = {};
    tarn->GetTypeInfo(0, 0, nullptr);
    const HRESULT found = tarn->GetIDsOfNames(IID_NULL, names, 2, 0, ids);
    const HRESULT called = tarn->Invoke(0, IID_NULL, 0, 1, &none, nullptr, nullptr, nullptr);
    Log("answers " + Hex(found) + ", " + Hex(called));
  };
  const auto nest = [&](const char* when) {
    on["call 7"] = [&] { use(when); };
    EXPECT_EQ(1, ExecuteFor(&inner, macroPath.c_str()));
    EXPECT_TRUE(inner.IsClean());
  };
  on["call 7"] = [&] {
    tarn = Item();
    nest("inside of an inner run");
    EXPECT_TRUE(host.Engine()) << "another host's record is separate";
    use("after the inner run");
  };
  Run();
  on["call 7"] = [&] { tarn = Item(), Stop(host.Engine()); };
  Run();
  use("after a stop");
  nest("in a run after a stop");
}

TEST_F(RunTest, MacroFiles) {
  const std::string locked = testFolder + "\\locked.rbs";
  WriteBytes(locked, "x");
  HANDLE lock = CreateFileA(locked.c_str(), GENERIC_READ, 0, nullptr, OPEN_EXISTING, 0, nullptr);
  const std::string large = testFolder + "\\large.rbs";
  HANDLE file = CreateFileA(large.c_str(), GENERIC_WRITE, 0, nullptr, CREATE_NEW, 0, nullptr);
  SetFilePointerEx(file, {{2, 1}}, nullptr, FILE_BEGIN);  // 4 GiB and two bytes
  EXPECT_TRUE(SetEndOfFile(file) && CloseHandle(file));
  testing::internal::CaptureStderr();
  Run(testFolder + "\\missing");
  Log("standard error: " + testing::internal::GetCapturedStderr());
  for (const std::string& path :
       {testFolder, locked, large, ""s, "C:\\" + std::string(5000, 'x'), "%s%n*?"s})
    Run(path);
  CloseHandle(lock);

  // Byte for byte up to the first NUL, as the C runtime's plain locale has it.
  std::wstring bytes;
  for (wchar_t byte = 255; byte > 0; --byte) bytes += byte;
  for (const std::wstring& macro : {L""s, L"abc\r\n"s, bytes, std::wstring(50 * 1024 * 1024, 'x')})
    for (const std::string& tail : {""s, "\0x"s}) {
      WriteBytes(macroPath, std::string(macro.begin(), macro.end()) + tail), Run();
      EXPECT_TRUE(macro == source);
    }

  // In a host's own locale, and up to where bytes that are no character end the conversion.
  ASSERT_TRUE(setlocale(LC_CTYPE, "Japanese"));
  for (const char* macro : {"\x83\x65 ok", "\x83\x65 ok\x81\n more"}) {
    wchar_t expected[32] = L"";
    mbstowcs(expected, macro, std::size(expected));
    // The block for the text is one that has been used before.
    std::vector<void*> used(100);
    for (void*& block : used) {
      block = CoTaskMemAlloc(2 * strlen(macro) + 20);
      memset(block, 'x', 2 * strlen(macro) + 20);
    }
    std::for_each(used.begin(), used.end(), CoTaskMemFree);
    WriteBytes(macroPath, macro), Run();
    EXPECT_EQ(expected, source);
  }
  setlocale(LC_CTYPE, "C");
}
