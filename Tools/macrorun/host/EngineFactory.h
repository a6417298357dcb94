// SPDX-License-Identifier: MIT
// The class object through which COM creates this program's script engines. There is one for the
// process, because COM also gets it through the exported DllGetClassObject.
//
// Ownership: it lives as long as the program; references are not counted. Threading: the thread
// that runs macros.
#pragma once

#include <windows.h>
// unknwn.h needs windows.h before it.
#include <unknwn.h>

class EngineFactory final : public IClassFactory {
 public:
  // Creates the engines.
  class Source {
   public:
    virtual ~Source() = default;
    virtual HRESULT Create(REFIID riid, void** object) = 0;
  };

  static EngineFactory& Instance();

  // Null: no engine can be created.
  void SetSource(Source* engineSource) { source = engineSource; }

  STDMETHODIMP QueryInterface(REFIID riid, void** object) override;
  STDMETHODIMP_(ULONG) AddRef() override { return 1; }
  STDMETHODIMP_(ULONG) Release() override { return 1; }
  STDMETHODIMP CreateInstance(IUnknown* outer, REFIID riid, void** object) override;
  STDMETHODIMP LockServer(BOOL) override { return S_OK; }

 private:
  Source* source = nullptr;
};
