// SPDX-License-Identifier: MIT
// Keeps the script engines of this program within reach. The module creates an engine by its ProgID
// and gets a proxy of it, which is in the list of running engines until its final release.
//
// Errors: UsageError for a manifest that the system refuses.
// Threading: one object at a time, on the thread that runs macros.
#pragma once

#include <string>

#include "host/EngineActivation.h"
#include "host/EngineFactory.h"
#include "host/RunningEngines.h"

class EngineWatch final : public EngineFactory::Source {
 public:
  // The calling thread finds the engine until the object is destroyed. Does nothing for an unknown
  // ProgID: the module reports it.
  explicit EngineWatch(const std::string& engine);
  ~EngineWatch() override;
  EngineWatch(const EngineWatch&) = delete;
  EngineWatch& operator=(const EngineWatch&) = delete;

  RunningEngines& Running() { return running; }
  HRESULT Create(REFIID riid, void** object) override;

 private:
  EngineActivation activation;
  RunningEngines running;
};
