// SPDX-License-Identifier: MIT
#include "cScript.h"

#include <objbase.h>
#include <stdio.h>
#include <string.h>

#include "MacroRuby.h"
#include "cLib/cCompat.h"
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

static void RestoreCaller(const ExecuteCall& run) {
  CurrentStopPoint() = run.previousStop;
  SetCurrentHost(run.previousHost);
}

static void FinishRun(ExecuteCall& run) {
  // From here on the run cannot be stopped: it is over.
  CurrentStopPoint().armed = false;
  HostContext& context = *run.host->Context();
  context.ArgumentList().Clear();
  context.ResultTexts().Clear();
  context.engine = nullptr;
  if (run.engine) run.engine->Destroy();
  RestoreCaller(run);
}

// The guarded part of a run. A stop comes back to the setjmp with everything between skipped.
static void RunArmed(void* context) {
  ExecuteCall& run = *static_cast<ExecuteCall*>(context);
  StopPoint& stop = CurrentStopPoint();
  if (setjmp(stop.buffer) == 0) {
    stop.thread = CurrentThread();
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

static void ForgetEngine(void* host) {
  static_cast<HostInterface*>(host)->Context()->engine = nullptr;
}

// One of the two lists of a host's record, after a fault: its elements may fault when deleted, and
// it may be unreadable.
template <auto list>
struct FaultedList {
  HostInterface* host;
  u32 held;  // elements when last counted

  static auto& ListOf(void* context) {
    return (static_cast<FaultedList*>(context)->host->Context()->*list)();
  }
  static void ClearList(void* context) { ListOf(context).Clear(); }
  static void Forget(void* context) { ListOf(context).Forget(); }
  static void Count(void* context) {
    static_cast<FaultedList*>(context)->held = ListOf(context).Occupied();
  }

  // An element leaves its list before its destructor runs. So a failed try is repeated as long as
  // the tries before it have taken elements off; then the rest is abandoned.
  void Clear() {
    for (u32 before = kLargestSize; !RunGuarded(ClearList, this); before = held)
      if (!RunGuarded(Count, this) || held >= before) {
        RunGuarded(Forget, this);
        return;
      }
  }
};

// After a fault nothing that the engine holds is trusted: it is leaked, on purpose. What the host
// does on this path may fault again, so each step has its own guard; and it may not stop this run,
// whose armed frame is gone, nor its caller before that is restored.
static void AbandonRun(ExecuteCall& run) {
  CurrentStopPoint().armed = false;
  run.engine = nullptr;
  run.result = -1;
  RunGuarded(ReportFault, &run);
  RunGuarded(ForgetEngine, run.host);
  FaultedList<&HostContext::ArgumentList>{run.host, 0}.Clear();
  FaultedList<&HostContext::ResultTexts>{run.host, 0}.Clear();
  RestoreCaller(run);
}

static void ReportNoFile(void* host) {
  static_cast<HostInterface*>(host)->ReportMessage("Unexpected internal macro execute error!");
}

i32 __stdcall execute(const char* file, HostInterface* host) {
  if (!host) return -1;
  if (!file) {
    RunGuarded(ReportNoFile, host);
    return -1;
  }
  ExecuteCall run = {file, host, CurrentHost(), CurrentStopPoint(), nullptr, -1};
  SetCurrentHost(host);
  if (!RunGuarded(RunArmed, &run)) AbandonRun(run);
  return run.result;
}

// --- kill ----------------------------------------------------------------------------------------

struct KillCall {
  i32 value;
  bool marked;
};

// Volatile: a host that polls the flag from another thread then finds its value.
static void MarkRecord(void* context) {
  KillCall& call = *static_cast<KillCall*>(context);
  HostInterface* host = CurrentHost();
  volatile HostContext* record = host ? host->Context() : nullptr;
  if (!record) return;
  record->stopValue = call.value;
  record->stopRequested = 1;
  call.marked = true;
}

bool __stdcall kill(i32 value) {
  KillCall call = {value, false};
  RunGuarded(MarkRecord, &call);
  return call.marked;
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

struct VersionCall {
  ScriptInfoRecord* record;
  const char* hostPath;
  bool filled;
};

static void AnswerVersion(void* context) {
  VersionCall& call = *static_cast<VersionCall*>(context);
  ScriptInfoRecord* record = call.record;
  if (!record || record->size != sizeof(ScriptInfoRecord)) return;
  if (record->layoutVersion != 0 && record->layoutVersion != kScriptInfoRecordVersion)
    ShowProblem(__LINE__, "Scripting size problems. This may cause problems!");
  memset(record, 0, sizeof *record);
  call.filled = FillRecord(record, call.hostPath);
}

static void FailVersion(void* context) {
  const ScriptInfoRecord* record = static_cast<VersionCall*>(context)->record;
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
}

bool __stdcall version(ScriptInfoRecord* record, const char* hostPath) {
  VersionCall call = {record, hostPath, false};
  RunGuarded(AnswerVersion, &call);
  if (!call.filled) RunGuarded(FailVersion, &call);
  return call.filled;
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
  // The mode is the process's: written only when a bit is missing, so that what other threads set
  // in the meantime is kept.
  constexpr UINT kNoBoxes = SEM_FAILCRITICALERRORS | SEM_NOOPENFILEERRORBOX;
  const UINT mode = GetErrorMode();
  if ((mode & kNoBoxes) != kNoBoxes) SetErrorMode(mode | kNoBoxes);
  const HRESULT initialised =
      CoInitializeEx(nullptr, COINIT_APARTMENTTHREADED | COINIT_DISABLE_OLE1DDE);
  const BOOL started = StartModule();
  // On a thread of another apartment nothing was initialised; its own count must stay.
  if (SUCCEEDED(initialised)) CoUninitialize();
  return started;
}
