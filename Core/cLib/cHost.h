// SPDX-License-Identifier: MIT
// The contract between the host editor and the module: the host macro interface, the context
// record, and the module's view of the host that is current. Docs/abi.md describes it for host
// developers; the byte offsets and the slot order are fixed by the editors in the field.
//
// Ownership: the host owns both objects. Threading: everything here belongs to the host thread that
// called `execute`, but for what `kill` does from any thread: it asks for the current host and its
// record and writes the record's two stop fields.
//
// Next on the reader's path: Core/xLib/xMacro.h, the engine that `execute` drives.
#pragma once

#include <stddef.h>

#include "cLib/cArray.h"
#include "cLib/cSlots.h"
#include "cLib/cString.h"

class xArgument;
class xMacro;

// The host's answer to FunctionId for a name that it does not know.
constexpr u32 kUnknownFunction = 2000;

// Marks a text result in HostContext::resultKind.
constexpr u32 kTextResult = 1;

#pragma pack(push, 1)
// The byte-packed record through which arguments, results and the stop request pass. It ends here
// for the module; the host's record may go on.
struct HostContext {
  u8 reserved0[8];
  u8 siteFlag;       // written when a script site is made
  u8 stopRequested;  // set to 1 by `kill`
  i32 stopValue;     // the value passed to `kill`
  u8 reserved14[4];
  xMacro* engine;  // the running engine, null when no run is active
  u8 reserved22[1];
  u32 resultKind;     // kTextResult or anything else
  i32 integerResult;  // of the last macro function call
  // Two Arrays by value, deliberately at offsets that no compiler would align (this processor does
  // not mind): reach them through the functions.
  u8 resultTexts[20];
  u8 argumentList[20];

  // Array<String>, filled by the host.
  Array<String>& ResultTexts() { return *reinterpret_cast<Array<String>*>(resultTexts); }
  // Array<xArgument>, filled by the module before each call.
  Array<xArgument>& ArgumentList() { return *reinterpret_cast<Array<xArgument>*>(argumentList); }
};
#pragma pack(pop)

#if CORE_MICROSOFT_ABI
static_assert(offsetof(HostContext, siteFlag) == 8, "the host reads it here");
static_assert(offsetof(HostContext, stopRequested) == 9, "the host polls it here");
static_assert(offsetof(HostContext, stopValue) == 10, "the host reads it here");
static_assert(offsetof(HostContext, engine) == 18, "the host calls stop through it");
static_assert(offsetof(HostContext, resultKind) == 23, "the host writes it here");
static_assert(offsetof(HostContext, integerResult) == 27, "the host writes it here");
static_assert(offsetof(HostContext, resultTexts) == 31, "the host's Array of String");
static_assert(offsetof(HostContext, argumentList) == 51, "the host's Array of arguments");
static_assert(sizeof(HostContext) == 71, "the part of the host's record that the module touches");
#endif

// The host macro interface. Never created or freed by the module. The slots that the module does
// not call keep their places; the host fills them as it likes.
class HostInterface {
 public:
  SLOTS_FROM(0);
  SLOT(0) void Unused0() = 0;
  SLOT(1) HostContext* Context() = 0;
  SLOT(2) void ReportMessage(const char* text) = 0;               // for the user
  SLOT(3) void __cdecl DebugOutput(const char* format, ...) = 0;  // trace lines
  SLOT(4) void SetFixCRLF(u8 flag) = 0;                           // before every call
  SLOT(5) void SetFixDelimiter(u8 flag) = 0;                      // before every call
  SLOT(6) void Unused6() = 0;
  SLOT(7) u32 FunctionId(const char* name) = 0;  // kUnknownFunction: no such function
  SLOT(8) void Unused8() = 0;
  SLOT(9) void* WindowHandle() = 0;  // HWND of the host's main window
  SLOT(10) void Unused10() = 0;
  SLOT(11) void Unused11() = 0;
  SLOT(12) void CallFunction(u32 id) = 0;  // arguments and result through the record

 protected:
  ~HostInterface() = default;
};

// The host whose `execute` is running, null between runs. `execute` sets and restores it.
HostInterface* CurrentHost();
void SetCurrentHost(HostInterface* host);

// Sends one trace line to `host` (format "Debug: %s\n"); nothing when it is null.
void TraceTo(HostInterface* host, const char* text);
