// SPDX-License-Identifier: MIT
// The library win32ole inside of the engine. A macro finds the host's object as an active object, so
// that each call of it takes win32ole's way and not the engine's own.
#include <setjmp.h>

#include <thread>

#include "EngineHost.h"

namespace {

constexpr CLSID kPeerClass = {
    0x7E5A3B10, 0x52C1, 0x4D7E, {0x8A, 0x21, 0x6F, 0x0D, 0x3C, 0x94, 0xB7, 0x58}};
const std::string kConnect =
    "require 'win32ole'; $peer = WIN32OLE.connect('{7E5A3B10-52C1-4D7E-8A21-6F0D3C94B758}')\n";

jmp_buf target;

// A host whose item is an active object, and keeps the Ruby object that it is given.
struct Peer {
  Peer() {
    host.item.byReference = true;
    host.item.Add("f");
    host.item.Add("keep", [this](Item::Call call) {
      VARIANT* const value = &call.arguments->rgvarg[0];
      IDispatch* const object = (value->vt & VT_BYREF ? value->pvarVal : value)->pdispVal;
      object->AddRef();
      Release();
      kept = object;
      return S_OK;
    });
    host.item.Does("call", [this] { Log(Call()); });
    host.item.Does("thread", [this] { std::thread([&] { Log(Call()); }).join(); });
    host.item.Does("nest",
                   [this] { Log("[" + inner.Run(kConnect + "$peer.f 3; raise 'inner'") + "]"); });
    host.item.Does("close", [this] { host.script->Close(); });
    host.item.Does("jump", [] { longjmp(target, 1); });
    host.item.Does("fault", [] { *reinterpret_cast<volatile int*>(8) = 1; });
    inner.item.Add("f");
    EXPECT_TRUE(SUCCEEDED(OleInitialize(nullptr)));
    EXPECT_EQ(S_OK, RegisterActiveObject(&host.item, kPeerClass, ACTIVEOBJECT_STRONG, &cookie));
    base = host.item.references;
    host.item.references = 1;  // what Close compares with
  }
  ~Peer() {
    Release();
    host.item.references += base - 1;
    RevokeActiveObject(cookie, nullptr);
    OleUninitialize();
  }

  // Calls the Ruby object as a function of one argument; also with no place for a result.
  std::string Call() {
    VARIANT argument = Value(VT_I4, 7), result = {};
    DISPPARAMS parameters = {&argument, nullptr, 1, 0};
    EXCEPINFO exception = {};
    const HRESULT outcome = kept->Invoke(DISPID_VALUE, IID_NULL, 0, DISPATCH_METHOD, &parameters,
                                         &result, &exception, nullptr);
    std::string shown = SUCCEEDED(outcome) ? Show(result) : Hex(outcome);
    if (exception.bstrDescription) shown += " " + Show(Value(VT_BSTR, exception.bstrDescription));
    VariantClear(&result);
    for (BSTR text : {exception.bstrDescription, exception.bstrSource}) SysFreeString(text);
    return "called: " + shown;
  }
  void Release() {
    if (kept) kept->Release();
    kept = nullptr;
  }

  Host host, inner;
  IDispatch* kept = nullptr;
  DWORD cookie = 0;
  ULONG base = 0;
};

}  // namespace

// The outcome is the log; behind it what the Ruby object answers between the run and the end of the
// engine, and after it.
TEST(Ole, CallsInAllDirections) {
  Peer peer;
  CheckTranscript("win32ole.txt", [&](const std::string& macro) {
    peer.host.Open();
    const HRESULT parsed = peer.host.Parse(kConnect + macro);
    const HRESULT started = SUCCEEDED(parsed) ? peer.host.Start() : parsed;
    if (started != S_OK) Log(Hex(started));
    if (peer.kept) Log("later"), Log(peer.Call());
    peer.host.Close();
    if (peer.kept) Log("closed"), Log(peer.Call());
    peer.Release();
    return TakeLog();
  });
}

// The host leaves a call that win32ole makes; `ensure` blocks run, and the next macro is whole.
TEST(Ole, HostLeaves) {
  Peer peer;
  for (int i = 0; i < 20; ++i) {
    peer.host.Open();
    const bool jumps = i % 2 == 0;
    peer.host.Parse(kConnect + "begin; $peer." + (jumps ? "jump" : "fault") +
                    "; ensure; $trail = 1; $peer.f; end");
    if (!jumps) {
      EXPECT_EQ(EXCEPTION_ACCESS_VIOLATION, Guarded([&] { peer.host.Start(); }));
    } else if (!setjmp(target)) {
      peer.host.Start();
      ADD_FAILURE();
    }
    peer.host.Close();
    EXPECT_EQ(jumps ? "item.jump()" : "item.fault()", TakeLog());
    EXPECT_EQ("item.f(I4 1)", peer.host.Run("@item.f 1"));
  }
}
