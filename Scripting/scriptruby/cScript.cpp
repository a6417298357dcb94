// SPDX-License-Identifier: MIT
#include "cScript.h"

#include <objbase.h>
#include <stdio.h>
#include <string.h>

#include "MacroRuby.h"
#include "cLib/cHost.h"
#include "cLib/cReport.h"
#include "cLib/cStop.h"
#include "iLib/iCodePage.h"
#include "iLib/iGuard.h"
#include "iLib/iModule.h"
#include "xLib/ScriptInfoRecord.h"
#include "xLib/xApp.h"
#include "xLib/xArgument.h"
#include "xLib/xProduct.h"

// --- execute -------------------------------------------------------------------------------------

// One call of `execute`. It lives in that call's frame, so it survives the jump of a stop.
struct MacroRun {
  const char* file;
  HostInterface* host;
  HostInterface* previousHost;
  StopPoint previousStop;
  xMacro* engine;
  i32 result;
};

static void RunEngine(MacroRun& run) {
  run.engine = CreateMacroEngine();
  if (!run.engine) {
    REPORT_ASSERT("cScript", "No memory for the macro engine");
    return;
  }
  run.host->Context()->engine = run.engine;
  run.engine->Initialise();
  run.result = run.engine->Run(run.file);
}

static void ClearContext(void* host) {
  HostContext& context = *static_cast<HostInterface*>(host)->Context();
  context.ArgumentList().Clear();
  context.ResultTexts().Clear();
  context.engine = nullptr;
}

static void RestoreCaller(const MacroRun& run) {
  CurrentStopPoint() = run.previousStop;
  SetCurrentHost(nullptr);
  SetCurrentHost(run.previousHost);
}

static void FinishRun(MacroRun& run) {
  ClearContext(run.host);
  xMacro* engine = run.engine;
  run.engine = nullptr;
  if (engine) engine->Destroy();
  RestoreCaller(run);
}

// The guarded part of a run. A stop comes back to the setjmp with everything between skipped.
static void RunArmed(void* context) {
  MacroRun& run = *static_cast<MacroRun*>(context);
  StopPoint& stop = CurrentStopPoint();
  if (setjmp(stop.buffer) == 0) {
    stop.armed = true;
    RunEngine(run);
  } else {
    run.result = -1;
  }
  FinishRun(run);
}

static void ReportFault(void* context) {
  const MacroRun& run = *static_cast<MacroRun*>(context);
  char text[4096];
  snprintf(text, sizeof text, "%s\nScript file Name: %s\n",
           "Tarn has detected an internal scripting exception, most probably caused\n"
           "by something in the syntax of the scripting macro code.\n\n"
           "Please help us by sending a short bug report including the script code\n"
           "that is causing the issue:\n\n"
           "Please send your bug report to this address: " SCRIPTRUBY_SUPPORT_ADDRESS "\nTIA.\n",
           run.file);
  run.host->ReportMessage(text);
}

// After a fault nothing that the engine holds is trusted: it is leaked, on purpose. What the host
// does on this path may fault again, so each step has its own guard.
static void AbandonRun(MacroRun& run) {
  // The armed frame is gone; a stop from here on must not go there.
  CurrentStopPoint() = run.previousStop;
  run.engine = nullptr;
  run.result = -1;
  RunGuarded(ReportFault, &run);
  // An element whose destructor faults has left its list by then: the next try goes on behind it.
  constexpr int kTries = 100;
  for (int tries = 0; tries < kTries && !RunGuarded(ClearContext, run.host); ++tries) {
  }
  RestoreCaller(run);
}

i32 __stdcall execute(const char* file, HostInterface* host) {
  if (!host) return -1;
  if (!file) {
    host->ReportMessage("Unexpected internal macro execute error!");
    return -1;
  }
  MacroRun run = {file, host, CurrentHost(), CurrentStopPoint(), nullptr, -1};
  SetCurrentHost(host);
  if (!RunGuarded(RunArmed, &run)) AbandonRun(run);
  return run.result;
}

// --- kill ----------------------------------------------------------------------------------------

bool __stdcall kill(i32 value) {
  HostInterface* host = CurrentHost();
  HostContext* context = host ? host->Context() : nullptr;
  if (!context) return false;
  context->stopRequested = 1;
  context->stopValue = value;
  return true;
}

// --- version -------------------------------------------------------------------------------------

static void ShowProblem(int line, const char* text) {
  Report("cScript", line, text, kReportVerify);
  ShowExceptionBox(text);
}

// Asks the running engine, else one made for the purpose.
static bool FillRecord(ScriptInfoRecord* record, const char* hostPath) {
  HostInterface* host = CurrentHost();
  HostContext* context = host ? host->Context() : nullptr;
  if (context && context->engine) return context->engine->FillVersion(record, hostPath);
  xMacro* engine = CreateMacroEngine();
  if (!engine) {
    REPORT_ASSERT("cScript", "No memory for the macro engine");
    return false;
  }
  const bool filled = engine->FillVersion(record, hostPath);
  engine->Destroy();
  return filled;
}

struct RecordName {
  const ScriptInfoRecord* record;
  char text[sizeof ScriptInfoRecord::description];  // zeroed by the caller
};

// Copies what the caller left as its name. The record may be shorter than its layout, so this runs
// guarded, byte by byte.
static void CopyRecordName(void* context) {
  RecordName& name = *static_cast<RecordName*>(context);
  for (u32 i = 0; i + 1 < sizeof name.text && name.record->description[i]; ++i)
    name.text[i] = name.record->description[i];
}

static bool FailVersion(const ScriptInfoRecord* record) {
  RecordName name = {record, "<Unknown>"};
  if (record) {
    memset(name.text, 0, sizeof name.text);
    RunGuarded(CopyRecordName, &name);
  }
  String text;
  text.Format("Module: %s\n\nUnexpected internal macro version error!\n", name.text);
  ShowProblem(__LINE__, text.Text());
  return false;
}

bool __stdcall version(ScriptInfoRecord* record, const char* hostPath) {
  if (!record || record->size != sizeof(ScriptInfoRecord)) return FailVersion(record);
  if (record->layoutVersion != 0 && record->layoutVersion != kScriptInfoRecordVersion)
    ShowProblem(__LINE__, "Scripting size problems. This may cause problems!");
  memset(record, 0, record->size);
  return FillRecord(record, hostPath) || FailVersion(record);
}

// --- Load notification ---------------------------------------------------------------------------

// The module's own start: there is nothing to start yet, so loading always succeeds.
static BOOL StartModule() { return 1; }

static void NameLogFile() {
  char path[256];
  const DWORD length = GetEnvironmentVariableA("SCRIPTRUBY_LOG", path, sizeof path);
  if (length > 0 && length < sizeof path) SetLogFile(path);
}

// Runs under the loader's lock. The steps are the same for processes and threads, attaching and
// detaching; only the process-wide settings are read once.
extern "C" BOOL WINAPI DllMain(HINSTANCE module, DWORD reason, LPVOID) {
  if (reason == DLL_PROCESS_ATTACH) {
    SetActiveCodePageFromKeyboard();
    NameLogFile();
  }
  SetRunsInApplication(false);
  KeepModuleHandle(module);
  SetErrorMode(GetErrorMode() | SEM_FAILCRITICALERRORS | SEM_NOOPENFILEERRORBOX);
  CoInitializeEx(nullptr, COINIT_APARTMENTTHREADED | COINIT_DISABLE_OLE1DDE);
  const BOOL started = StartModule();
  CoUninitialize();
  return started;
}
