// SPDX-License-Identifier: MIT
#include "EngineManifest.h"

#include <objbase.h>

#include <filesystem>

#include "Encoding.h"
#include "ExitCode.h"
#include "Options.h"

EngineManifest::EngineManifest() {
  CLSID registered;
  if (SUCCEEDED(CLSIDFromProgID(L"RubyScript", &registered))) return;
  const std::filesystem::path file = ProgramFolder() / "ruby" / "bin" / "rubyscript.manifest";
  std::error_code error;
  if (!std::filesystem::exists(file, error)) return;
  // The engine's files are looked for in the folder of the manifest.
  ACTCTXW source = {};
  source.cbSize = sizeof source;
  source.lpSource = file.c_str();
  context = CreateActCtxW(&source);
  if (context == INVALID_HANDLE_VALUE)
    throw UsageError("cannot use " + ToUtf8(file) + ": " + SystemMessage(GetLastError()));
  ActivateActCtx(context, &cookie);
}

EngineManifest::~EngineManifest() {
  if (context == INVALID_HANDLE_VALUE) return;
  // By force: a macro is stopped by a jump, which may leave contexts behind that the system has
  // activated below it.
  if (cookie != 0) DeactivateActCtx(DEACTIVATE_ACTCTX_FLAG_FORCE_EARLY_DEACTIVATION, cookie);
  ReleaseActCtx(context);
}
