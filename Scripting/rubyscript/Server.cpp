// SPDX-License-Identifier: MIT
#include "Server.h"

#include <objbase.h>
#include <olectl.h>

#include "ClassFactory.h"
#include "Interpreter.h"
#include "Registration.h"

static HMODULE serverModule = nullptr;
static volatile LONG serverReferences = 0;

HMODULE ServerModule() { return serverModule; }

void AddServerReference() { InterlockedIncrement(&serverReferences); }
void ReleaseServerReference() { InterlockedDecrement(&serverReferences); }

STDAPI DllGetClassObject(REFCLSID classId, REFIID riid, void** object) {
  if (!object) return E_POINTER;
  *object = nullptr;
  if (!IsEqualCLSID(classId, kScriptEngineClass)) return CLASS_E_CLASSNOTAVAILABLE;
  return ScriptEngineFactory()->QueryInterface(riid, object);
}

// CRuby cannot be started twice in a process: once it runs, it stays, and the server with it.
STDAPI DllCanUnloadNow() {
  return serverReferences == 0 && !Interpreter::HasStarted() ? S_OK : S_FALSE;
}

STDAPI DllRegisterServer() { return RegisterEngine(serverModule); }
STDAPI DllUnregisterServer() { return UnregisterEngine(); }

extern "C" BOOL WINAPI DllMain(HINSTANCE module, DWORD reason, LPVOID) {
  if (reason == DLL_PROCESS_ATTACH) {
    serverModule = module;
    DisableThreadLibraryCalls(module);
  }
  return TRUE;
}
