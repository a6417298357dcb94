// SPDX-License-Identifier: MIT
// A host and an engine that answer, at every slot and step, anything that its type allows, and that
// nest runs, stop, kill, ask for the version and fault wherever they are called.
#include "Faults.h"
#include "TortureTest.h"

static class RandomHostTest* running = nullptr;

class RandomHostTest : public TortureTest {
 protected:
  RandomHostTest() {
    running = this;
    plain = host.table;
    table.assign(host.table, host.table + 13);
    table[1] = reinterpret_cast<void*>(Context);
    table[7] = reinterpret_cast<void*>(FunctionId);
    table[9] = reinterpret_cast<void*>(WindowHandle);
  }
  ~RandomHostTest() override { running = nullptr; }

  static void* THISCALL Context(RawHost* host) {
    // Now and then it hides its record.
    if (running->OneIn(200)) return running->hid = true, nullptr;
    return host->context;
  }
  static unsigned THISCALL FunctionId(RawHost*, const char*) {
    running->Act();
    return running->OneIn(4) ? running->random() : 7;
  }
  static void* THISCALL WindowHandle(RawHost*) {
    running->Act();
    return reinterpret_cast<void*>(static_cast<uintptr_t>(running->random()));
  }

  // Something that a host may do whenever it is called.
  void Act() {
    if (depth > 2 || !OneIn(8)) return;
    char record[392] = {'\x88', 1};  // its size
    switch (Below(6)) {
      case 0:
        ++depth, Run(), --depth;
        break;
      case 1:
        if (host.Engine()) Stop(host.Engine());
        break;
      case 2:
        Kill(static_cast<int>(random()));
        break;
      case 3:
        if (!hid) CallExport<bool>(dll, "version", &record[0], "");
        break;
      case 4:
        if (OneIn(4)) ++faults, kFaults[Below(kFaults.size())].second();
        break;
      default:
        if (host.Engine()) CallSlot<void>(host.Engine(), 2);
    }
  }

  // A macro function.
  void Answer() {
    Act();
    At<unsigned>(host.context, 27) = random();
    if (At<int>(host.context, 31 + 8) != 0) return;  // what a nested run has left
    std::vector<std::string> texts(OneIn(2) ? Below(8) : 0);
    for (std::string& text : texts) text = Bytes(6000);
    host.AnswerTexts(texts, OneIn(3) ? random() : 1);
    if (texts.empty() && OneIn(8)) At<int>(host.context, 31 + 8) = -static_cast<int>(Below(9));
  }

  void Script() {
    static const wchar_t* const names[] = {L"tarn", L"f", L"", L"unknown \u20AC", nullptr};
    for (unsigned steps = Below(6); steps > 0; --steps) switch (Below(4)) {
        case 0: {
          IUnknown* item = nullptr;
          ITypeInfo* type = nullptr;
          site->GetItemInfo(names[Below(5)], Below(4), OneIn(4) ? nullptr : &item,
                            OneIn(4) ? nullptr : &type);
          break;
        }
        case 1:
          site->OnScriptError(nullptr);
          break;
        default:
          if (Item()) Call(names[Below(4)], std::vector<VARIANT>(Below(60), Value(VT_I4, 1)));
      }
  }

  void OneRun() {
    static const char* const steps[] = {"QueryInterface",      "QueryInterface of the parser",
                                        "SetScriptSite",       "InitNew",
                                        "AddNamedItem tarn 2", "ParseScriptText",
                                        "SetScriptState 2",    "SetScriptState 4"};
    static const HRESULT answers[] = {E_FAIL, S_FALSE, E_OUTOFMEMORY, 0x7FFFFFFF};
    results.clear();
    for (const char* step : steps)
      if (OneIn(24)) results[step] = answers[Below(4)];
    hid = false, depth = faults = faultReports = 0;
    host.table = table.data();
    const int result = Run();
    host.table = plain;
    results.clear();
    EXPECT_TRUE(result >= -1 && result <= 1);
    if (!hid) {
      EXPECT_TRUE(host.IsClean());
      EXPECT_LE(faultReports, faults) << "the module itself has faulted";
    }
    // What the module could not reach is the host's own to clear.
    host.Engine() = nullptr;
    ClearTexts();
  }

  void ClearTexts() {
    for (int i = At<int>(host.context, 31 + 8) - 1; i >= 0; --i) {
      void* const text = At<void**>(host.context, 31 + 16)[i];
      CallSlot<void*>(text, 0, 1u);
    }
    At<int>(host.context, 31 + 8) = 0;
    // The elements are lost with their list, which the module alone can free.
    At<int>(host.context, 51 + 8) = 0;
  }

  void** plain;
  std::vector<void*> table;
  bool hid = false;
  int depth = 0, faults = 0, faultReports = 0;
};

TEST_F(RandomHostTest, LeavesItsRecordCleanAndTheNextRunRight) {
  on.clear();
  on["call "] = [&] { Answer(); };
  on["engine: SetScriptState 2"] = [&] { Script(); };
  for (const char* line :
       {"engine: A", "engine: I", "engine: P", "engine: Q", "engine: SetScriptSi",
        "engine: SetScriptState 4", "report: C", "report: E", "report: \n", "trace: ", "fix "})
    on[line] = [&] { Act(); };
  on["report: Tarn has"] = [&] { ++faultReports, Act(); };
  const int runs = Rounds(100000, 400);
  Resources early = {};  // after a tenth
  for (int i = 0; i < runs && !HasFailure(); ++i) {
    SCOPED_TRACE("run " + std::to_string(i));
    OneRun();
    ExpectRightRun();
    if (i == runs / 10) early = Used();
  }
  const unsigned handles = Used().handles;
  Figure("%d runs, a right one after each, %u handles after a tenth and %u at the end", runs,
         early.handles, handles);
  EXPECT_LE(handles, early.handles + kOwnHandles);
}
