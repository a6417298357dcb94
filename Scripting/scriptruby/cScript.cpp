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
#include "xLib/xTexts.h"

// --- execute -------------------------------------------------------------------------------------

// One call of `execute`. It lives in that call's frame, so it survives the jump of a stop.
struct ExecuteCall {
  const char* file;
  HostInterface* host;
  HostInterface* previousHost;
  StopPoint previousStop;
  xMacro* engine;
  i32 result;
};

static void RunEngine(ExecuteCall& run) {
  run.engine = CreateMacroEngine();
  if (!run.engine) {
    REPORT_ASSERT("cScript", "No memory for the macro engine");
    return;
  }
  run.host->Context()->engine = run.engine;
  run.engine->Initialise();
  run.result = run.engine->Run(run.file);
}

static HostContext& ContextOf(void* host) { return *static_cast<HostInterface*>(host)->Context(); }

static void ForgetEngine(void* host) { ContextOf(host).engine = nullptr; }
static void ClearArguments(void* host) { ContextOf(host).ArgumentList().Clear(); }
static void ClearTexts(void* host) { ContextOf(host).ResultTexts().Clear(); }
static void ForgetArguments(void* host) { ContextOf(host).ArgumentList().Forget(); }
static void ForgetTexts(void* host) { ContextOf(host).ResultTexts().Forget(); }

static void RestoreCaller(const ExecuteCall& run) {
  CurrentStopPoint() = run.previousStop;
  SetCurrentHost(run.previousHost);
}

static void FinishRun(ExecuteCall& run) {
  // From here on the run cannot be stopped: it is over.
  CurrentStopPoint().armed = false;
  ClearArguments(run.host);
  ClearTexts(run.host);
  ForgetEngine(run.host);
  if (run.engine) run.engine->Destroy();
  RestoreCaller(run);
}

// The guarded part of a run. A stop comes back to the setjmp with everything between skipped.
static void RunArmed(void* context) {
  ExecuteCall& run = *static_cast<ExecuteCall*>(context);
  StopPoint& stop = CurrentStopPoint();
  if (setjmp(stop.buffer) == 0) {
    stop.armed = true;
    RunEngine(run);
  } else {
    run.result = -1;
  }
  FinishRun(run);
}

// A copy of text that may end where readable memory ends: what could be read, terminated.
struct TextCopy {
  const char* source;
  char* target;  // zeroed by the caller
  u32 size;      // of the target
};

static void CopyReadable(void* context) {
  const TextCopy& copy = *static_cast<TextCopy*>(context);
  for (u32 i = 0; i + 1 < copy.size && copy.source[i]; ++i) copy.target[i] = copy.source[i];
}

static void ReportFault(void* context) {
  const ExecuteCall& run = *static_cast<ExecuteCall*>(context);
  char file[4096] = "";
  TextCopy name = {run.file, file, sizeof file};
  RunGuarded(CopyReadable, &name);
  char text[4096];
  snprintf(text, sizeof text, "%s%s\nScript file Name: %s\n", kFaultReport,
           ", most probably caused\n"
           "by something in the syntax of the scripting macro code.\n\n"
           "Please help us by sending a short bug report including the script code\n"
           "that is causing the issue:\n\n"
           "Please send your bug report to this address: " SCRIPTRUBY_SUPPORT_ADDRESS "\nTIA.\n",
           file);
  run.host->ReportMessage(text);
}

// Each failing try leaves one element fewer: it has left its list when its destructor faults. A
// list that cannot be cleared is only emptied.
static void ClearAfterFault(void (*clear)(void*), void (*forget)(void*), HostInterface* host) {
  constexpr int kTries = 100;
  for (int tries = 0; tries < kTries; ++tries)
    if (RunGuarded(clear, host)) return;
  RunGuarded(forget, host);
}

// After a fault nothing that the engine holds is trusted: it is leaked, on purpose. What the host
// does on this path may fault again, so each step has its own guard; and it may not stop this run,
// whose armed frame is gone, nor its caller before that is restored.
static void AbandonRun(ExecuteCall& run) {
  CurrentStopPoint().armed = false;
  run.engine = nullptr;
  run.result = -1;
  RunGuarded(ReportFault, &run);
  RunGuarded(ForgetEngine, run.host);
  ClearAfterFault(ClearArguments, ForgetArguments, run.host);
  ClearAfterFault(ClearTexts, ForgetTexts, run.host);
  RestoreCaller(run);
}

i32 __stdcall execute(const char* file, HostInterface* host) {
  if (!host) return -1;
  if (!file) {
    host->ReportMessage("Unexpected internal macro execute error!");
    return -1;
  }
  ExecuteCall run = {file, host, CurrentHost(), CurrentStopPoint(), nullptr, -1};
  SetCurrentHost(host);
  if (!RunGuarded(RunArmed, &run)) AbandonRun(run);
  return run.result;
}

// --- kill ----------------------------------------------------------------------------------------

bool __stdcall kill(i32 value) {
  HostInterface* host = CurrentHost();
  HostContext* context = host ? host->Context() : nullptr;
  if (!context) return false;
  context->stopValue = value;  // first: a host that polls the flag then finds its value
  context->stopRequested = 1;
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

static bool FailVersion(const ScriptInfoRecord* record) {
  char name[sizeof record->description] = "<Unknown>";
  if (record) {
    // What the caller left as its name; the record may be shorter than its layout.
    memset(name, 0, sizeof name);
    TextCopy copy = {record->description, name, sizeof name};
    RunGuarded(CopyReadable, &copy);
  }
  String text;
  text.Format("Module: %s\n\nUnexpected internal macro version error!\n", name);
  ShowProblem(__LINE__, text.Text());
  return false;
}

bool __stdcall version(ScriptInfoRecord* record, const char* hostPath) {
  if (!record || record->size != sizeof(ScriptInfoRecord)) return FailVersion(record);
  if (record->layoutVersion != 0 && record->layoutVersion != kScriptInfoRecordVersion)
    ShowProblem(__LINE__, "Scripting size problems. This may cause problems!");
  memset(record, 0, sizeof *record);
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
  constexpr UINT kNoBoxes = SEM_FAILCRITICALERRORS | SEM_NOOPENFILEERRORBOX;
  SetErrorMode(SetErrorMode(kNoBoxes) | kNoBoxes);
  const HRESULT initialised =
      CoInitializeEx(nullptr, COINIT_APARTMENTTHREADED | COINIT_DISABLE_OLE1DDE);
  const BOOL started = StartModule();
  // On a thread of another apartment nothing was initialised; its own count must stay.
  if (SUCCEEDED(initialised)) CoUninitialize();
  return started;
}
