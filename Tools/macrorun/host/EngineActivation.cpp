// SPDX-License-Identifier: MIT
#include "host/EngineActivation.h"

#include <objbase.h>

#include <cwchar>
#include <filesystem>

#include "host/EngineFactory.h"
#include "host/EngineManifest.h"
#include "platform/Encoding.h"
#include "platform/ExitCode.h"
#include "platform/ProgramFile.h"

namespace {

constexpr wchar_t kNameInManifest[] = L"macrorun.exe";
constexpr wchar_t kEngineInManifest[] = L"RubyScript";

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

EngineActivation::EngineActivation(const std::string& engine)
    : progId(PathFromUtf8(engine).wstring()) {
  CoInitialize(nullptr);
  if (SUCCEEDED(CLSIDFromProgID(progId.c_str(), &registeredClass)))
    RegisterClassObject();
  else if (_wcsicmp(progId.c_str(), kEngineInManifest) == 0)
    ActivateManifests();
}

EngineActivation::~EngineActivation() {
  if (registration != 0) CoRevokeClassObject(registration);
  // A macro is stopped by a jump, which can leave contexts active that the system has activated
  // after this one.
  if (cookie != 0) DeactivateActCtx(DEACTIVATE_ACTCTX_FLAG_FORCE_EARLY_DEACTIVATION, cookie);
  if (programContext != INVALID_HANDLE_VALUE) ReleaseActCtx(programContext);
  if (engineContext != INVALID_HANDLE_VALUE) ReleaseActCtx(engineContext);
  CoUninitialize();
}

// The system looks for the engine's files in the folder of its manifest.
void EngineActivation::ActivateManifests() {
  const std::filesystem::path file = ProgramFolder() / "ruby" / "bin" / "rubyscript.manifest";
  std::error_code error;
  if (!std::filesystem::exists(file, error)) return;
  engineContext = OpenContext(file, nullptr);
  if (_wcsicmp(ProgramFile().filename().c_str(), kNameInManifest) == 0)
    programContext = OpenContext(ProgramFile(), MAKEINTRESOURCEW(kEngineManifest));
  ActivateActCtx(programContext != INVALID_HANDLE_VALUE ? programContext : engineContext, &cookie);
}

void EngineActivation::RegisterClassObject() {
  CoRegisterClassObject(registeredClass, &EngineFactory::Instance(), CLSCTX_INPROC_SERVER,
                        REGCLS_MULTIPLEUSE, &registration);
}

HRESULT EngineActivation::CreateEngine(IActiveScript** engine) {
  return registration != 0 ? CreateRegistered(engine) : CreateFromManifest(engine);
}

// Revokes the class object meanwhile: otherwise COM would find it again.
HRESULT EngineActivation::CreateRegistered(IActiveScript** engine) {
  CoRevokeClassObject(registration);
  const HRESULT result = CoCreateInstance(registeredClass, nullptr, CLSCTX_INPROC_SERVER,
                                          IID_IActiveScript, reinterpret_cast<void**>(engine));
  RegisterClassObject();
  return result;
}

HRESULT EngineActivation::CreateFromManifest(IActiveScript** engine) {
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
