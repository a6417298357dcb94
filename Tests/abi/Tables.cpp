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

// A table is emitted where a constructor is: those of interfaces through a derived class.
struct Host : HostInterface {
  Host();
};
Host::Host() {}
struct Dispatch : xScript {
  using xScript::xScript;
};

Dispatch dispatch(false, false);
String text;
Array<String> array;
List<String> list;
ListIter<String> cursor(list);
FIFO<String> history(3);
Stack<String> stack;
cHashTable<String> table;
StringDZ lines;
xArgument argument("");
xScriptInfo info(false);
MacroRuby engine;
xScriptExecutor site(nullptr, false, false, 0);
