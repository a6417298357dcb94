// SPDX-License-Identifier: MIT
// The script engines of a run: how the module finds them, and how a macro that calls nothing is
// interrupted.
//
// The module asks COM for an engine by its ProgID. This class answers with a class object of its own,
// which makes the real engine and hands it out in a wrapper that tells when it goes (WatchedEngine.h).
// For an engine that is registered, the class object is registered in this process under the engine's
// class. Activation contexts go before that, so for the Ruby engine that lies beside this program and is
// registered nowhere, a manifest inside macrorun.exe names the program itself as the engine's server
// (DllGetClassObject, exported). Under another file name the program runs Ruby macros as well, but
// interrupts none.
//
// Ownership: it holds no engine. Those that a stop or a fault has left must not be touched any more, and
// never go: the run says so with Abandon.
// Errors: UsageError for a manifest that the system refuses.
// Threading: one object at a time, on the thread that runs macros. Interrupt may come from any.
#pragma once

#include <activscp.h>
#include <windows.h>

#include <mutex>
#include <string>
#include <vector>

#include "host/WatchedEngine.h"

// By which the report of an interruption is recognised.
inline constexpr char kInterruption[] = "macrorun interrupts the macro";

class EngineWatch final : public WatchedEngine::Owner {
 public:
  // From here to the destructor the calling thread finds the engine. Nothing happens when there is
  // none of that ProgID: the module reports it.
  explicit EngineWatch(const std::string& engine);
  ~EngineWatch() override;
  EngineWatch(const EngineWatch&) = delete;
  EngineWatch& operator=(const EngineWatch&) = delete;

  // Asks all engines to end what they run; whether one of them can. An engine that knows where that was
  // tells its site of an error with the text kInterruption.
  bool Interrupt();
  void Abandon();

  void Going(WatchedEngine* engine) override;

  // The calls inside the innermost macro that led to the present one, "macro:3:in `f'" a line, innermost
  // first; empty when its engine cannot tell. Only within a call.
  std::string CallChain();

  // For the class object: makes an engine.
  HRESULT Create(REFIID riid, void** object);

 private:
  void RegisterClassObject();
  HRESULT CreateRegistered(IActiveScript** engine);
  HRESULT CreateFromManifest(IActiveScript** engine);

  const std::wstring progId;
  CLSID registeredClass = {};
  DWORD registration = 0;
  HANDLE engineContext = INVALID_HANDLE_VALUE;  // the engine's own manifest
  HANDLE ownContext = INVALID_HANDLE_VALUE;     // this program as its server
  ULONG_PTR cookie = 0;
  std::mutex lock;
  std::vector<WatchedEngine*> engines;
};
