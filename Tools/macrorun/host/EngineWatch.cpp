// SPDX-License-Identifier: MIT
#include "host/EngineWatch.h"

#include <new>

EngineWatch::EngineWatch(const std::string& engine) : activation(engine) {
  EngineFactory::Instance().SetSource(this);
}

EngineWatch::~EngineWatch() { EngineFactory::Instance().SetSource(nullptr); }

HRESULT EngineWatch::Create(REFIID riid, void** object) {
  IActiveScript* engine = nullptr;
  const HRESULT created = activation.CreateEngine(&engine);
  if (FAILED(created)) return created;
  if (!engine) return E_POINTER;
  IActiveScriptParse* parser = nullptr;
  const HRESULT parses =
      engine->QueryInterface(kActiveScriptParse, reinterpret_cast<void**>(&parser));
  ScriptEngineProxy* const proxy =
      SUCCEEDED(parses) ? new (std::nothrow) ScriptEngineProxy(engine, parser, running) : nullptr;
  if (!proxy) {
    if (parser) parser->Release();
    engine->Release();
    return FAILED(parses) ? parses : E_OUTOFMEMORY;
  }
  running.Add(proxy);
  const HRESULT result = proxy->QueryInterface(riid, object);
  proxy->Release();
  return result;
}
