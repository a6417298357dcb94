// SPDX-License-Identifier: MIT
#include "ScriptEngine.h"

#include <oleauto.h>
#include <stdio.h>
#include <wchar.h>

#include <new>

#include "ComObject.h"
#include "ScriptDispatch.h"
#include "Server.h"
#include "UnwindHandler.h"

// The 32-bit form of the parser's interface; libraries carry only the other one.
static constexpr IID kActiveScriptParse = {
    0xBB1A2AE2, 0xA4F9, 0x11CF, {0x8F, 0x20, 0x00, 0x80, 0x5F, 0x2C, 0xD0, 0x64}};

// The name by which the 8-bit host is known.
static constexpr wchar_t kByteHostItem[] = L"tarn";

// All that there are, created on any thread.
static ScriptEngine* engines = nullptr;
static SRWLOCK enginesLock = SRWLOCK_INIT;

HRESULT CreateScriptEngine(REFIID riid, void** object) {
  EngineState* const engineState = new (std::nothrow) EngineState;
  ScriptEngine* const engine = engineState ? new (std::nothrow) ScriptEngine(engineState) : nullptr;
  if (!engine) {
    delete engineState;
    return E_OUTOFMEMORY;
  }
  const HRESULT result = engine->QueryInterface(riid, object);
  engine->Release();
  return result;
}

ScriptEngine::ScriptEngine(EngineState* newState) : engineState(newState) {
  AddServerReference();
  AcquireSRWLockExclusive(&enginesLock);
  next = engines;
  engines = this;
  ReleaseSRWLockExclusive(&enginesLock);
}

ScriptEngine::~ScriptEngine() {
  AcquireSRWLockExclusive(&enginesLock);
  ScriptEngine** link = &engines;
  while (*link != this) link = &(*link)->next;
  *link = next;
  ReleaseSRWLockExclusive(&enginesLock);
  if (!engineState->context) delete engineState;
  ReleaseServerReference();
}

HRESULT ScriptEngine::QueryInterface(REFIID riid, void** object) {
  if (!object) return E_POINTER;
  *object = nullptr;
  if (riid == IID_IUnknown || riid == __uuidof(IActiveScript))
    *object = static_cast<IActiveScript*>(this);
  else if (riid == kActiveScriptParse)
    *object = static_cast<IActiveScriptParse*>(this);
  else if (riid == IID_IObjectSafety)
    *object = static_cast<IObjectSafety*>(this);
  if (!*object) return E_NOINTERFACE;
  AddRef();
  return S_OK;
}

ULONG ScriptEngine::AddRef() { return static_cast<ULONG>(InterlockedIncrement(&references)); }

ULONG ScriptEngine::Release() {
  const LONG left = InterlockedDecrement(&references);
  if (left == 0) {
    references = 1;  // closing adds and releases references
    // Another thread cannot close it: it is leaked deliberately, with everything it holds.
    if (Close() != E_UNEXPECTED) delete this;
  }
  return static_cast<ULONG>(left);
}

// --- Calls ---------------------------------------------------------------------------------------

// A call of the host that may call it back: keeps engine and site alive, also from a host that lets
// go of them meanwhile, and gives both back when its frame is discarded.
class ScriptEngine::Call {
 public:
  explicit Call(ScriptEngine* called)
      : engine(called), site(called->site), unwindHandler(End, this) {
    engine->AddRef();
    if (site) site->AddRef();
    ++engine->calls;
  }
  ~Call() {
    if (engine->calls == 1 && engine->closing) engine->FinishClose();
    End(this);
  }

 private:
  static void End(void* context) {
    Call& call = *static_cast<Call*>(context);
    if (--call.engine->calls == 0) call.engine->closing = false;
    if (call.site) call.site->Release();
    call.engine->Release();
  }

  ScriptEngine* const engine;
  IActiveScriptSite* const site;
  UnwindHandler unwindHandler;
};

// --- Site and states -----------------------------------------------------------------------------

// On its own thread, with a site, and neither closed nor about to be. To be asked again after every
// call out.
bool ScriptEngine::IsUsable() const {
  return thread == GetCurrentThreadId() && site && state != SCRIPTSTATE_CLOSED && !closing;
}

bool ScriptEngine::IsStarted() const {
  return state == SCRIPTSTATE_STARTED || state == SCRIPTSTATE_CONNECTED ||
         state == SCRIPTSTATE_DISCONNECTED;
}

HRESULT ScriptEngine::SetScriptSite(IActiveScriptSite* newSite) {
  if (!newSite) return E_POINTER;
  if (site || state == SCRIPTSTATE_CLOSED) return E_UNEXPECTED;
  thread = GetCurrentThreadId();
  site = newSite;
  site->AddRef();
  const Call call(this);
  if (initialized) ChangeState(SCRIPTSTATE_INITIALIZED);
  return S_OK;
}

HRESULT ScriptEngine::GetScriptSite(REFIID riid, void** object) {
  if (!object) return E_POINTER;
  *object = nullptr;
  return site ? site->QueryInterface(riid, object) : S_FALSE;
}

HRESULT ScriptEngine::InitNew() {
  if (initialized || state == SCRIPTSTATE_CLOSED) return E_UNEXPECTED;
  if (site && thread != GetCurrentThreadId()) return E_UNEXPECTED;
  const Call call(this);
  initialized = true;
  if (site) ChangeState(SCRIPTSTATE_INITIALIZED);
  return S_OK;
}

void ScriptEngine::ChangeState(SCRIPTSTATE newState) {
  if (state == newState) return;
  state = newState;
  if (site) site->OnStateChange(newState);
}

// Downwards the states are passed one by one, each with its notification.
void ScriptEngine::LowerState(SCRIPTSTATE newState) {
  if (state == SCRIPTSTATE_CONNECTED) ChangeState(SCRIPTSTATE_DISCONNECTED);
  if (newState == SCRIPTSTATE_DISCONNECTED) return;
  if (IsStarted()) {
    ChangeState(SCRIPTSTATE_INITIALIZED);
    if (newState == SCRIPTSTATE_INITIALIZED) Reset(false);
  }
  if (newState == SCRIPTSTATE_INITIALIZED) return;
  Reset(true);
  ChangeState(newState);
  IActiveScriptSite* const oldSite = site;
  site = nullptr;
  if (oldSite) oldSite->Release();
}

HRESULT ScriptEngine::SetScriptState(SCRIPTSTATE newState) {
  if (newState == state && (IsUsable() || state == SCRIPTSTATE_CLOSED)) return S_FALSE;
  if (!IsUsable()) return E_UNEXPECTED;
  const bool nested = calls > 0;
  const Call call(this);
  switch (newState) {
    case SCRIPTSTATE_STARTED:
    case SCRIPTSTATE_CONNECTED:
      return initialized ? Start(newState) : E_UNEXPECTED;
    case SCRIPTSTATE_DISCONNECTED:
      if (!IsStarted()) return E_UNEXPECTED;
      ChangeState(SCRIPTSTATE_DISCONNECTED);
      return S_OK;
    case SCRIPTSTATE_INITIALIZED:
    case SCRIPTSTATE_UNINITIALIZED:
      if (nested || (newState == SCRIPTSTATE_INITIALIZED && !initialized)) return E_UNEXPECTED;
      LowerState(newState);
      return S_OK;
    case SCRIPTSTATE_CLOSED:
      return Close();
  }
  return E_INVALIDARG;
}

HRESULT ScriptEngine::Start(SCRIPTSTATE newState) {
  const bool first = !IsStarted();
  if (first) {
    const HRESULT requested = RequestItems();
    if (FAILED(requested)) return requested;
  }
  ChangeState(newState);
  if (!first) return S_OK;
  return IsUsable() ? RunQueue(nullptr, nullptr) : E_ABORT;
}

HRESULT ScriptEngine::GetScriptState(SCRIPTSTATE* current) {
  if (!current) return E_POINTER;
  *current = state;
  return S_OK;
}

// Called back by the engine, the host has what runs ended first; the rest follows at its end.
HRESULT ScriptEngine::Close() {
  if (state == SCRIPTSTATE_CLOSED || closing) return S_FALSE;
  if (thread != 0 && thread != GetCurrentThreadId()) return E_UNEXPECTED;
  closing = true;
  if (calls > 0)
    Interpreter::Interrupt(this);
  else
    const Call call(this);  // whose end closes
  return S_OK;
}

void ScriptEngine::FinishClose() {
  LowerState(SCRIPTSTATE_CLOSED);
  closing = false;
}

// Lets go of the context and of the items; what is persistent stays unless `all`.
void ScriptEngine::Reset(bool all) {
  if (engineState->context && Interpreter::Start() == S_OK) {
    MacroTask* const task = NewTask(MacroTask::Kind::kDiscard, nullptr);
    if (task) {
      task->persistent = !all;
      if (Interpreter::Enter(task) == S_OK) delete task;
    }
  }
  if (Interpreter::IsMainThread() && !Interpreter::FatalExceptionCode()) {
    ReleaseObjectsOf(this);
    ReleaseCollectedObjects();
  }
  if (all) textFormKnown = false;
  NamedItem** link = &items;
  while (NamedItem* const item = *link) {
    if (item->dispatch) item->dispatch->Release();
    item->dispatch = nullptr;
    item->requested = false;
    if (!all && (item->flags & SCRIPTITEM_ISPERSISTENT)) {
      link = &item->next;
      continue;
    }
    *link = item->next;
    SysFreeString(item->name);
    delete item;
  }
}

// --- Items ---------------------------------------------------------------------------------------

// It has to be the name of an instance variable.
static bool IsIdentifier(LPCOLESTR name) {
  const auto isLetter = [](wchar_t unit) {
    return ((unit | 0x20) >= 'a' && (unit | 0x20) <= 'z') || unit == '_' || unit >= 0x80;
  };
  if (!isLetter(*name)) return false;
  for (; *name; ++name)
    if (!isLetter(*name) && !(*name >= '0' && *name <= '9')) return false;
  return true;
}

const NamedItem* ScriptEngine::FindItem(LPCOLESTR name) const {
  for (const NamedItem* item = items; item; item = item->next)
    if (wcscmp(item->name, name) == 0) return item;
  return nullptr;
}

HRESULT ScriptEngine::AddNamedItem(LPCOLESTR name, DWORD flags) {
  if (!name) return E_POINTER;
  if (!IsUsable()) return E_UNEXPECTED;
  constexpr DWORD kKnownFlags = SCRIPTITEM_ALL_FLAGS;
  if ((flags & ~kKnownFlags) || !IsIdentifier(name)) return E_INVALIDARG;
  NamedItem* const item = new (std::nothrow) NamedItem{};
  if (item) item->name = SysAllocString(name);
  if (!item || !item->name) {
    delete item;
    return E_OUTOFMEMORY;
  }
  item->flags = flags;
  NamedItem** end = &items;
  while (*end) end = &(*end)->next;
  *end = item;
  return S_OK;
}

// Asks the site for the objects of all items that are new.
HRESULT ScriptEngine::RequestItems() {
  for (NamedItem* item = items; item; item = item->next) {
    if (!IsUsable()) return E_ABORT;
    if (item->requested || (item->flags & SCRIPTITEM_CODEONLY)) continue;
    IUnknown* unknown = nullptr;
    HRESULT result = site->GetItemInfo(item->name, SCRIPTINFO_IUNKNOWN, &unknown, nullptr);
    if (FAILED(result)) return result;
    if (!unknown) return E_UNEXPECTED;
    void* dispatch = nullptr;
    result = unknown->QueryInterface(IID_IDispatch, &dispatch);
    unknown->Release();
    if (FAILED(result)) return result;
    item->dispatch = static_cast<IDispatch*>(dispatch);
    item->requested = true;
  }
  return IsUsable() ? S_OK : E_ABORT;
}

HRESULT ScriptEngine::GetScriptDispatch(LPCOLESTR itemName, IDispatch** dispatch) {
  if (!dispatch) return E_POINTER;
  *dispatch = nullptr;
  if (!IsUsable() || !IsStarted()) return E_UNEXPECTED;
  if (itemName && *itemName && !FindItem(itemName)) return E_INVALIDARG;
  *dispatch = new (std::nothrow) ScriptDispatch(this);
  return *dispatch ? S_OK : E_OUTOFMEMORY;
}

// --- Code ----------------------------------------------------------------------------------------

MacroTask* ScriptEngine::NewTask(MacroTask::Kind kind, LPCOLESTR text) {
  MacroTask* const task = new (std::nothrow) MacroTask(this, kind, *engineState, items);
  if (!task || !text) return task;
  task->text = SysAllocString(text);
  if (task->text) return task;
  delete task;
  return nullptr;
}

HRESULT ScriptEngine::ParseScriptText(LPCOLESTR code, LPCOLESTR itemName, IUnknown*, LPCOLESTR,
                                      DWORD cookie, ULONG firstLine, DWORD flags, VARIANT* result,
                                      EXCEPINFO* exception) {
  if (result) VariantInit(result);
  if (exception) *exception = {};
  if (!code) return E_POINTER;
  if (!IsUsable() || !initialized) return E_UNEXPECTED;
  if (itemName && *itemName && !FindItem(itemName)) return E_INVALIDARG;
  const Call call(this);
  if (!textFormKnown)
    engineState->form =
        FindItem(kByteHostItem) && IsByteText(code) ? TextForm::kBytes : TextForm::kUtf16;
  textFormKnown = true;
  MacroTask* const task = NewTask(MacroTask::Kind::kCompile, code);
  if (!task) return E_OUTOFMEMORY;
  task->firstLine = firstLine;
  task->cookie = cookie;
  task->persistent = (flags & SCRIPTTEXT_ISPERSISTENT) != 0;
  const HRESULT compiled = Perform(task, nullptr, exception);
  if (FAILED(compiled) || !IsStarted()) return compiled;
  const HRESULT requested = RequestItems();
  const bool isExpression = (flags & SCRIPTTEXT_ISEXPRESSION) != 0;
  return FAILED(requested) ? requested : RunQueue(isExpression ? result : nullptr, exception);
}

HRESULT ScriptEngine::RunQueue(VARIANT* result, EXCEPINFO* exception) {
  MacroTask* const task = NewTask(MacroTask::Kind::kRun, nullptr);
  if (task) task->wantsValue = result != nullptr;
  return Perform(task, result, exception);
}

HRESULT ScriptEngine::Defines(LPCOLESTR name) {
  if (!IsUsable() || !IsStarted()) return E_UNEXPECTED;
  const Call call(this);
  return Perform(NewTask(MacroTask::Kind::kDefines, name), nullptr, nullptr);
}

HRESULT ScriptEngine::CallFunction(LPCOLESTR name, const DISPPARAMS* arguments, VARIANT* result,
                                   EXCEPINFO* exception) {
  if (!IsUsable() || !IsStarted()) return E_UNEXPECTED;
  const Call call(this);
  MacroTask* const task = NewTask(MacroTask::Kind::kCall, name);
  if (task) task->arguments = arguments;
  return Perform(task, result, exception);
}

HRESULT ScriptEngine::CallBack(const void* owner, unsigned long (*body)(unsigned long),
                               unsigned long data) {
  AcquireSRWLockShared(&enginesLock);
  ScriptEngine* engine = engines;
  while (engine && engine != owner) engine = engine->next;
  ReleaseSRWLockShared(&enginesLock);
  if (!engine || !engine->IsUsable() || !engine->IsStarted()) return CO_E_OBJNOTCONNECTED;
  const Call call(engine);
  MacroTask* const task = engine->NewTask(MacroTask::Kind::kCallBack, nullptr);
  if (!task) return E_OUTOFMEMORY;
  task->callBack = body;
  task->callBackData = data;
  return engine->Perform(task, nullptr, nullptr);
}

// Runs and deletes the task, in a Call; what went wrong has gone to the site.
HRESULT ScriptEngine::Perform(MacroTask* task, VARIANT* result, EXCEPINFO* exception) {
  if (!task) return E_OUTOFMEMORY;
  const bool runsCode = task->kind == MacroTask::Kind::kRun ||
                        task->kind == MacroTask::Kind::kCall ||
                        task->kind == MacroTask::Kind::kCallBack;
  if (runsCode) site->OnEnterScript();
  HRESULT outcome = E_ABORT;
  if (IsUsable())
    outcome = Enter(task, exception);
  else
    delete task;
  if (outcome == S_OK) {
    outcome = task->result;
    ScriptError* const error = task->error;
    task->error = nullptr;
    if (result && SUCCEEDED(outcome)) {
      *result = task->value;
      task->value = {};
    }
    delete task;
    if (error) outcome = Report(error, exception);
  }
  if (runsCode) site->OnLeaveScript();
  return outcome;
}

// Text for the site: why Ruby cannot be entered.
static void DescribeFailedStart(HRESULT started, wchar_t (&text)[256]) {
  if (started == E_ABORT) {
    swprintf(text, 256,
             L"Ruby was lost to a fault (exception 0x%08lX) in an earlier macro. Restart the "
             L"program to run Ruby macros again.",
             Interpreter::FatalExceptionCode());
    return;
  }
  const wchar_t* reason = L"Ruby could not be started in this process.";
  if (started == RPC_E_WRONG_THREAD)
    reason = L"Ruby macros run on the thread that ran the first one.";
  if (started == RPC_E_SERVER_DIED)
    reason =
        L"The thread that ran the first Ruby macro has ended. Restart the program to run Ruby "
        L"macros again.";
  if (started == Interpreter::kOtherCopy)
    reason =
        L"Another copy of the Ruby engine runs in this process. Use one copy of rubyscript.dll.";
  if (started == E_UNEXPECTED)
    reason = L"Ruby cannot be entered again from this call of the macro.";
  swprintf(text, 256, L"%ls", reason);
}

// S_OK: the task has run. On failure the task is deleted. A failure to start Ruby is reported to
// the site.
HRESULT ScriptEngine::Enter(MacroTask* task, EXCEPINFO* exception) {
  const HRESULT started = Interpreter::Start();
  if (started == S_OK) {
    const HRESULT entered = Interpreter::Enter(task);
    ReleaseCollectedObjects();
    return entered;
  }
  delete task;
  wchar_t text[256];
  DescribeFailedStart(started, text);
  ScriptError::Details details;
  details.code = started;
  details.description = SysAllocString(text);
  ScriptError* const error = new (std::nothrow) ScriptError(details);
  return error ? Report(error, exception) : started;
}

// Takes over the error.
HRESULT ScriptEngine::Report(ScriptError* error, EXCEPINFO* exception) {
  const bool taken = SUCCEEDED(site->OnScriptError(error));
  if (!taken) error->Fill(exception);
  error->Release();
  return taken ? SCRIPT_E_REPORTED : DISP_E_EXCEPTION;
}

// --- Threads -------------------------------------------------------------------------------------

HRESULT ScriptEngine::GetCurrentScriptThreadID(SCRIPTTHREADID* id) {
  if (!id) return E_POINTER;
  *id = GetCurrentThreadId();
  return S_OK;
}

HRESULT ScriptEngine::GetScriptThreadID(DWORD systemThread, SCRIPTTHREADID* id) {
  if (!id) return E_POINTER;
  *id = systemThread;
  return S_OK;
}

// Of all the thread ids there are, an engine of one thread knows three names for one.
static bool IsEngineThread(SCRIPTTHREADID id, DWORD thread) {
  return id == SCRIPTTHREADID_BASE || id == SCRIPTTHREADID_ALL || id == thread ||
         (id == SCRIPTTHREADID_CURRENT && thread == GetCurrentThreadId());
}

HRESULT ScriptEngine::GetScriptThreadState(SCRIPTTHREADID id, SCRIPTTHREADSTATE* current) {
  if (!current) return E_POINTER;
  *current = SCRIPTTHREADSTATE_NOTINSCRIPT;
  if (!IsEngineThread(id, thread)) return E_INVALIDARG;
  if (Interpreter::IsRunning(this)) *current = SCRIPTTHREADSTATE_RUNNING;
  return S_OK;
}

HRESULT ScriptEngine::InterruptScriptThread(SCRIPTTHREADID id, const EXCEPINFO* exception, DWORD) {
  if (state == SCRIPTSTATE_CLOSED) return E_UNEXPECTED;
  if (!IsEngineThread(id, thread)) return E_INVALIDARG;
  if (exception && exception->bstrDescription && Interpreter::IsRunning(this))
    SysFreeString(static_cast<BSTR>(
        InterlockedExchangePointer(reinterpret_cast<void**>(&engineState->interruption),
                                   SysAllocString(exception->bstrDescription))));
  Interpreter::Interrupt(this);
  return S_OK;
}

// --- Safety --------------------------------------------------------------------------------------

HRESULT ScriptEngine::GetInterfaceSafetyOptions(REFIID riid, DWORD* supported, DWORD* enabled) {
  if (!supported || !enabled) return E_POINTER;
  *supported = 0;
  *enabled = 0;
  void* object = nullptr;
  if (FAILED(QueryInterface(riid, &object))) return E_NOINTERFACE;
  static_cast<IUnknown*>(object)->Release();
  return S_OK;
}

HRESULT ScriptEngine::SetInterfaceSafetyOptions(REFIID riid, DWORD mask, DWORD options) {
  void* object = nullptr;
  if (FAILED(QueryInterface(riid, &object))) return E_NOINTERFACE;
  static_cast<IUnknown*>(object)->Release();
  return mask & options ? E_FAIL : S_OK;
}
