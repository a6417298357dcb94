// SPDX-License-Identifier: MIT
// What a script engine has done in the interpreter: compile a text, run what is compiled, call a
// macro's function. Around each one the engine's context is entered and left (prelude/context.rb),
// and the host's process state is put back (see ProcessStateSnapshot.h).
//
// Ownership: as RubyTask. What a task points to belongs to the engine and outlives the task, which
// may go on after the host has jumped away; what it holds itself goes with it.
// Errors: `result` and `error`. Threading: Run on the Ruby side, the rest on the host's.
#pragma once

#include <windows.h>
// Needs windows.h before it.
#include <oleauto.h>

#include "Interpreter.h"
#include "ScriptError.h"
#include "TextCoding.h"

enum class Outcome;  // see RubyCall.h

// An object that the host publishes under a name.
struct NamedItem {
  BSTR name;
  DWORD flags;
  IDispatch* dispatch;  // a reference for the interpreter, until it has taken it; then null
  bool requested;       // from the site
  NamedItem* next;
};

// What a script engine keeps between its tasks.
struct EngineState {
  ~EngineState() { SysFreeString(interruption); }

  unsigned long context = 0;  // a Ruby value, kept from collection; 0: none yet
  TextForm form = TextForm::kUtf16;
  // Owned; what the host has said of an interruption, on any thread. Taken when the task has ended.
  BSTR interruption = nullptr;
};

class MacroTask final : public RubyTask {
 public:
  enum class Kind {
    kCompile,   // `text`, for a later kRun
    kRun,       // all that is compiled; sets `value`
    kDefines,   // whether the macro has a function named `text`; S_OK or S_FALSE
    kCall,      // the function named `text`, with `arguments`; sets `value`
    kCallBack,  // `callBack`: Ruby code that COM calls through win32ole
    kDiscard,   // the context; what was persistent is compiled for the next one
  };

  MacroTask(const void* engine, Kind taskKind, EngineState& state, NamedItem* const& namedItems)
      : RubyTask(engine), kind(taskKind), engineState(state), items(namedItems) {}
  ~MacroTask() override;
  void Run() override;

  const Kind kind;
  EngineState& engineState;
  NamedItem* const& items;  // the engine's list
  BSTR text = nullptr;      // owned
  ULONG firstLine = 0;      // of the text, from 0
  DWORD cookie = 0;         // the host's own name for the text
  bool persistent = false;
  bool wantsValue = false;                             // of kRun
  const DISPPARAMS* arguments = nullptr;               // read before any macro code runs
  unsigned long (*callBack)(unsigned long) = nullptr;  // of kCallBack, with its argument
  unsigned long callBackData = 0;

  struct Code;  // one run of the macro's code

  HRESULT result = E_FAIL;
  ScriptError* error = nullptr;  // owned; null when there is none
  VARIANT value = {};            // owned

 private:
  static unsigned long PrepareBody(unsigned long task);
  static unsigned long WorkBody(unsigned long task);
  static unsigned long EndThreadsBody(unsigned long task);
  static unsigned long LeaveBody(unsigned long task);
  static unsigned long FinalizeBody(unsigned long task);
  static unsigned long DiscardBody(unsigned long task);
  static unsigned long DescribeBody(unsigned long data);
  static unsigned long StartBody(unsigned long code);
  static unsigned long CodeBody(unsigned long code);
  static unsigned long NextBlockBody(unsigned long code);
  static unsigned long ExitBlockBody(unsigned long code);
  static unsigned long FinishBody(unsigned long code);
  static unsigned long EndBody(unsigned long task);
  unsigned long Compile();
  Outcome RunCode(Code& code);
  Outcome RunMacro(unsigned long& value);
  void Work();
  void Discard();
  void RunInContext();
  // `hostText` of an interruption, else null.
  void SetError(unsigned long exception, BSTR hostText = nullptr);
  void TellInterruption(unsigned long exception);
  void SetValue(unsigned long passable);
};
