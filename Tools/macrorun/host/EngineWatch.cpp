// SPDX-License-Identifier: MIT
#include "host/EngineWatch.h"

#include <objbase.h>
#include <oleauto.h>

#include <cwchar>
#include <filesystem>
#include <new>

#include "host/EngineManifest.h"
#include "platform/Encoding.h"
#include "platform/ExitCode.h"
#include "platform/ProgramFile.h"

namespace {

constexpr wchar_t kNameInManifest[] = L"macrorun.exe";

EngineWatch* current = nullptr;

// Lives as long as the program: references are not counted.
class EngineFactory final : public IClassFactory {
 public:
  STDMETHODIMP QueryInterface(REFIID riid, void** object) override {
    if (!object) return E_POINTER;
    const bool known = riid == IID_IUnknown || riid == IID_IClassFactory;
    *object = known ? static_cast<IClassFactory*>(this) : nullptr;
    return known ? S_OK : E_NOINTERFACE;
  }
  STDMETHODIMP_(ULONG) AddRef() override { return 1; }
  STDMETHODIMP_(ULONG) Release() override { return 1; }
  STDMETHODIMP CreateInstance(IUnknown* outer, REFIID riid, void** object) override {
    if (!object) return E_POINTER;
    *object = nullptr;
    if (outer) return CLASS_E_NOAGGREGATION;
    return current ? current->Create(riid, object) : CO_E_CLASSSTRING;
  }
  STDMETHODIMP LockServer(BOOL) override { return S_OK; }
};

EngineFactory factory;

HANDLE OpenContext(const std::filesystem::path& file, LPCWSTR resource) {
  ACTCTXW source = {};
  source.cbSize = sizeof source;
  source.lpSource = file.c_str();
  source.lpResourceName = resource;
  if (resource) source.dwFlags = ACTCTX_FLAG_RESOURCE_NAME_VALID;
  const HANDLE context = CreateActCtxW(&source);
  if (context == INVALID_HANDLE_VALUE)
    throw UsageError("cannot use " + ToUtf8(file) + ": " + SystemMessage(GetLastError()));
  return context;
}

}  // namespace

EngineWatch::EngineWatch(const std::string& engine) : progId(PathFromUtf8(engine).wstring()) {
  CoInitialize(nullptr);
  current = this;
  if (SUCCEEDED(CLSIDFromProgID(progId.c_str(), &registeredClass))) {
    RegisterClassObject();
    return;
  }
  // The engine's files are looked for in the folder of its manifest.
  const std::filesystem::path file = ProgramFolder() / "ruby" / "bin" / "rubyscript.manifest";
  std::error_code error;
  if (_wcsicmp(progId.c_str(), L"RubyScript") != 0 || !std::filesystem::exists(file, error)) return;
  engineContext = OpenContext(file, nullptr);
  if (_wcsicmp(ProgramFile().filename().c_str(), kNameInManifest) == 0)
    ownContext = OpenContext(ProgramFile(), MAKEINTRESOURCEW(kEngineManifest));
  ActivateActCtx(ownContext != INVALID_HANDLE_VALUE ? ownContext : engineContext, &cookie);
}

EngineWatch::~EngineWatch() {
  if (registration != 0) CoRevokeClassObject(registration);
  // By force: a macro is stopped by a jump, which may leave contexts behind that the system has
  // activated below it.
  if (cookie != 0) DeactivateActCtx(DEACTIVATE_ACTCTX_FLAG_FORCE_EARLY_DEACTIVATION, cookie);
  if (ownContext != INVALID_HANDLE_VALUE) ReleaseActCtx(ownContext);
  if (engineContext != INVALID_HANDLE_VALUE) ReleaseActCtx(engineContext);
  current = nullptr;
  CoUninitialize();
}

void EngineWatch::RegisterClassObject() {
  CoRegisterClassObject(registeredClass, &factory, CLSCTX_INPROC_SERVER, REGCLS_MULTIPLEUSE,
                        &registration);
}

HRESULT EngineWatch::Create(REFIID riid, void** object) {
  IActiveScript* engine = nullptr;
  const HRESULT created =
      registration != 0 ? CreateRegistered(&engine) : CreateFromManifest(&engine);
  if (FAILED(created)) return created;
  if (!engine) return E_POINTER;
  IActiveScriptParse* parser = nullptr;
  const HRESULT parses =
      engine->QueryInterface(kActiveScriptParse, reinterpret_cast<void**>(&parser));
  WatchedEngine* const watched =
      SUCCEEDED(parses) ? new (std::nothrow) WatchedEngine(engine, parser, *this) : nullptr;
  if (!watched) {
    if (parser) parser->Release();
    engine->Release();
    return FAILED(parses) ? parses : E_OUTOFMEMORY;
  }
  {
    const std::lock_guard guard(lock);
    engines.push_back(watched);
  }
  const HRESULT result = watched->QueryInterface(riid, object);
  watched->Release();
  return result;
}

// Out of the way meanwhile, or the system would find this program's class object again.
HRESULT EngineWatch::CreateRegistered(IActiveScript** engine) {
  CoRevokeClassObject(registration);
  const HRESULT result = CoCreateInstance(registeredClass, nullptr, CLSCTX_INPROC_SERVER,
                                          IID_IActiveScript, reinterpret_cast<void**>(engine));
  RegisterClassObject();
  return result;
}

HRESULT EngineWatch::CreateFromManifest(IActiveScript** engine) {
  ULONG_PTR inner = 0;
  if (!ActivateActCtx(engineContext, &inner)) return HRESULT_FROM_WIN32(GetLastError());
  CLSID classId;
  HRESULT result = CLSIDFromProgID(progId.c_str(), &classId);
  if (SUCCEEDED(result))
    result = CoCreateInstance(classId, nullptr, CLSCTX_INPROC_SERVER, IID_IActiveScript,
                              reinterpret_cast<void**>(engine));
  DeactivateActCtx(0, inner);
  return result;
}

// Innermost first. Engines document this call for any thread.
bool EngineWatch::Interrupt() {
  const std::lock_guard guard(lock);
  EXCEPINFO reason = {};
  reason.bstrDescription = SysAllocString(PathFromUtf8(kInterruption).c_str());
  bool any = false;
  for (auto engine = engines.rbegin(); engine != engines.rend(); ++engine)
    any |= (*engine)->InterruptScriptThread(SCRIPTTHREADID_ALL, &reason, 0) == S_OK;
  SysFreeString(reason.bstrDescription);
  return any;
}

void EngineWatch::Going(WatchedEngine* engine) {
  const std::lock_guard guard(lock);
  std::erase(engines, engine);
}

// What runs is asked in its own language. Behind the macro's top level come the macros that wait for it.
std::string EngineWatch::CallChain() {
  constexpr wchar_t kInRuby[] =
      L"caller.grep(/\\Amacro:/).grep_v(/in `method_missing'\\z/).slice_after(/in `<compiled>'\\z/)"
      L".first.to_a.first(20).join(\"\\n\").gsub(\"<compiled>'\", \"<main>'\")";
  if (engines.empty() || progId.find(L"RubyScript") == progId.npos) return {};
  VARIANT chain;
  VariantInit(&chain);
  const HRESULT result = engines.back()->ParseScriptText(kInRuby, nullptr, nullptr, nullptr, 0, 0,
                                                         SCRIPTTEXT_ISEXPRESSION, &chain, nullptr);
  const bool told = SUCCEEDED(result) && chain.vt == VT_BSTR;
  const std::string text = told ? BytesOf(chain.bstrVal, SysStringLen(chain.bstrVal)) : "";
  VariantClear(&chain);
  return text;
}

void EngineWatch::Abandon() {
  const std::lock_guard guard(lock);
  engines.clear();
}

// The program as the server that its manifest names.
extern "C" HRESULT __stdcall DllGetClassObject(REFCLSID, REFIID riid, void** object) {
  return factory.QueryInterface(riid, object);
}
