// SPDX-License-Identifier: MIT
// Every class whose virtual table or size crosses the module's boundary, or that the tables are
// promised for. Compiled only for the compiler's dump of its tables (see CMakeLists.txt).
#include "MacroRuby.h"
#include "cLib/StringDZ.h"
#include "cLib/cArray.h"
#include "cLib/cFilo.h"
#include "cLib/cHashTable.h"
#include "cLib/cHost.h"
#include "xLib/xArgument.h"
#include "xLib/xScript.h"
#include "xLib/xScriptExecutor.h"
#include "xLib/xScriptInfo.h"

// A host of the compiler's own making: its table is the one that the module calls through.
struct Host : HostInterface {
  void Unused0() override {}
  HostContext* Context() override { return nullptr; }
  void ReportMessage(const char*) override {}
  void __cdecl DebugOutput(const char*, ...) override {}
  void SetFixCRLF(u8) override {}
  void SetFixDelimiter(u8) override {}
  void Unused6() override {}
  u32 FunctionId(const char*) override { return 0; }
  void Unused8() override {}
  void* WindowHandle() override { return nullptr; }
  void Unused10() override {}
  void Unused11() override {}
  void CallFunction(u32) override {}
};

// The dispatch object's table is emitted where its constructor is; a derived class shows it here.
struct Dispatch : xScript {
  using xScript::xScript;
};

void EmitTables();
void EmitTables() {
  static Host host;
  SetCurrentHost(&host);
  Dispatch dispatch(false, false);
  String text;
  Array<String> array;
  List<String> list;
  ListIter<String> cursor(list);
  FIFO<String> history(3);
  Stack<String> stack;
  cHashTable<String> table;
  StringDZ lines;
  xArgument argument;
  xScriptInfo info(false);
  MacroRuby engine;
  xScriptExecutor site(nullptr, false, false, 0);
  site.IsRunning();
}
