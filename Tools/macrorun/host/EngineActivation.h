// SPDX-License-Identifier: MIT
// Makes COM find EngineFactory under the ProgID of a script engine, and creates the real engine.
//
// For an engine that is registered, the class object is registered in this process under the
// engine's class. The Ruby engine in the folder `ruby` beside this program is not registered
// anywhere. Activation contexts take precedence over classes registered in the process. So a
// manifest inside macrorun.exe names the program itself as the engine's server (DllGetClassObject).
// Under another file name the program cannot use that manifest: it runs Ruby macros, but cannot
// interrupt them.
//
// Errors: UsageError for a manifest that the system refuses.
// Threading: the thread that runs macros; one object at a time.
#pragma once

#include <windows.h>
// activscp.h needs windows.h before it.
#include <activscp.h>

#include <string>

class EngineActivation {
 public:
  // Does nothing for an unknown ProgID: the module reports it.
  explicit EngineActivation(const std::string& engine);
  ~EngineActivation();
  EngineActivation(const EngineActivation&) = delete;
  EngineActivation& operator=(const EngineActivation&) = delete;

  HRESULT CreateEngine(IActiveScript** engine);

 private:
  void ActivateManifests();
  void RegisterClassObject();
  HRESULT CreateRegistered(IActiveScript** engine);
  HRESULT CreateFromManifest(IActiveScript** engine);

  const std::wstring progId;
  CLSID registeredClass = {};
  DWORD registration = 0;
  HANDLE engineContext = INVALID_HANDLE_VALUE;   // the engine's manifest
  HANDLE programContext = INVALID_HANDLE_VALUE;  // this program as the engine's server
  ULONG_PTR cookie = 0;
};
