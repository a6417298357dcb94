// SPDX-License-Identifier: MIT
// The Ruby engine that lies beside this program, for a machine on which none is registered.
#pragma once

#include <windows.h>

// The program's folder, seen from which `ruby\bin\rubyscript.manifest` describes the engine.
class EngineManifest {
 public:
  // From here to the destructor the calling thread finds the engine as if it were registered. Does
  // nothing when one is, or when no manifest is there. Throws UsageError for a manifest that the
  // system refuses.
  EngineManifest();
  ~EngineManifest();
  EngineManifest(const EngineManifest&) = delete;
  EngineManifest& operator=(const EngineManifest&) = delete;

 private:
  HANDLE context = INVALID_HANDLE_VALUE;
  ULONG_PTR cookie = 0;
};
