// SPDX-License-Identifier: MIT
#include "host/RunningEngines.h"

#include <oleauto.h>

#include "platform/Encoding.h"

void RunningEngines::Add(ScriptEngineProxy* engine) {
  const std::lock_guard guard(lock);
  engines.push_back(engine);
}

// Innermost first. Engines allow this call from any thread.
bool RunningEngines::Interrupt() {
  const std::lock_guard guard(lock);
  EXCEPINFO reason = {};
  reason.bstrDescription = SysAllocString(PathFromUtf8(kInterruption).c_str());
  bool any = false;
  for (auto engine = engines.rbegin(); engine != engines.rend(); ++engine)
    any |= (*engine)->InterruptScriptThread(SCRIPTTHREADID_ALL, &reason, 0) == S_OK;
  SysFreeString(reason.bstrDescription);
  return any;
}

void RunningEngines::Abandon() {
  const std::lock_guard guard(lock);
  engines.clear();
}

void RunningEngines::OnReleased(ScriptEngineProxy* engine) {
  const std::lock_guard guard(lock);
  std::erase(engines, engine);
}
