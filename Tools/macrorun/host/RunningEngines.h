// SPDX-License-Identifier: MIT
// The script engines that are in use, innermost run last: interrupts them, and reads the call chain
// of the innermost one.
//
// Ownership: holds no reference. After a stop or a fault an engine is never released and must not
// be used: the run then calls Abandon.
// Threading: the thread that runs macros. Interrupt may be called on any thread.
#pragma once

#include <mutex>
#include <string>
#include <vector>

#include "host/ScriptEngineProxy.h"

// The description of the error that an interrupted engine reports.
inline constexpr char kInterruption[] = "macrorun interrupts the macro";

class RunningEngines final : public ScriptEngineProxy::Owner {
 public:
  void Add(ScriptEngineProxy* engine);
  // Asks all engines to end their scripts; whether one of them can. An engine that knows where its
  // script was reports an error there, with the text kInterruption.
  bool Interrupt();
  void Abandon();
  void OnReleased(ScriptEngineProxy* engine) override;
  // The innermost engine. Null: none.
  ScriptEngineProxy* Innermost() const { return engines.empty() ? nullptr : engines.back(); }

 private:
  std::mutex lock;
  std::vector<ScriptEngineProxy*> engines;
};
