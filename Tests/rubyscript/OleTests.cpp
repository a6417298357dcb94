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
    "require 'win32ole'; $peer = WIN32OLE.connect('{7E5A3B10-52C1-4D7E-8A21-6F0D3C94B758}');"
    "def listen(&block) = WIN32OLE_EVENT.new($peer, 'DScriptControlSource').tap { |event| "
    "event.on_event(&block) if block }\n";

// The Error event of the script control, whose type library serves here.
constexpr DISPID kErrorEvent = 3000;
constexpr IID kControlInterface = {
    0x0E59F1D3, 0x1FBE, 0x11D0, {0x8F, 0xF2, 0x00, 0xA0, 0xD1, 0x00, 0x38, 0xBC}};

jmp_buf target;

// Keeps the sink that win32ole connects.
class EventSource final : public IConnectionPointContainer, public IConnectionPoint {
 public:
  STDMETHODIMP QueryInterface(REFIID, void**) override { return E_NOINTERFACE; }
  STDMETHODIMP_(ULONG) AddRef() override { return 2; }
  STDMETHODIMP_(ULONG) Release() override { return 1; }
  STDMETHODIMP EnumConnectionPoints(IEnumConnectionPoints**) override { return E_NOTIMPL; }
  STDMETHODIMP FindConnectionPoint(REFIID, IConnectionPoint** point) override {
    return *point = this, S_OK;
  }
  STDMETHODIMP GetConnectionInterface(IID*) override { return E_NOTIMPL; }
  STDMETHODIMP GetConnectionPointContainer(IConnectionPointContainer**) override {
    return E_NOTIMPL;
  }
  STDMETHODIMP Advise(IUnknown* newSink, DWORD* cookie) override {
    *cookie = 1;
    return newSink->QueryInterface(IID_IDispatch, reinterpret_cast<void**>(&sink));
  }
  STDMETHODIMP Unadvise(DWORD) override {
    Log("unadvised");
    Drop();
    return S_OK;
  }
  STDMETHODIMP EnumConnections(IEnumConnections**) override { return E_NOTIMPL; }

  void Drop() {
    if (sink) sink->Release();
    sink = nullptr;
  }
  void Fire() {
    DISPPARAMS none = {};
    if (sink)
      sink->Invoke(kErrorEvent, IID_NULL, 0, DISPATCH_METHOD, &none, nullptr, nullptr, nullptr);
  }

  IDispatch* sink = nullptr;
};

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
    host.item.Does("fire", [this] { source.Fire(); });
    host.item.Does("fire_in_thread", [this] { std::thread([&] { source.Fire(); }).join(); });
    host.item.extension = [this](REFIID riid) -> void* {
      if (riid != IID_IConnectionPointContainer) return nullptr;
      return static_cast<IConnectionPointContainer*>(&source);
    };
    ITypeLib* library = nullptr;
    EXPECT_EQ(S_OK, LoadTypeLib(L"msscript.ocx", &library));
    EXPECT_EQ(S_OK, library->GetTypeInfoOfGuid(kControlInterface, &host.item.type));
    library->Release();
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
  EventSource source;
  IDispatch* kept = nullptr;
  DWORD cookie = 0;
  ULONG base = 0;
};

}  // namespace

// The outcome is the log, then the Ruby object's answers between the run and the end of the engine,
// and after that end.
TEST(Ole, CallsInAllDirections) {
  Peer peer;
  CheckTranscript("win32ole.txt", [&](const std::string& macro) {
    peer.host.Open();
    const HRESULT parsed = peer.host.Parse(kConnect + macro);
    const HRESULT started = SUCCEEDED(parsed) ? peer.host.Start() : parsed;
    if (started != S_OK) Log(Hex(started));
    if (peer.kept) Log("later"), Log(peer.Call());
    if (peer.source.sink) Log("event"), peer.source.Fire();
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

// Other components, by win32ole and as objects that the host hands out. The script control runs the
// engine itself, inside of the macro that has made it.
TEST(Ole, OtherComponents) {
  std::string path = RUBYSCRIPT_DLL;
  path.replace(path.size() - 3, 3, "manifest");
  ACTCTXA manifest = {sizeof manifest, 0, path.c_str(), 0, 0, nullptr, nullptr, nullptr, nullptr};
  ULONG_PTR active = 0;
  ASSERT_TRUE(ActivateActCtx(CreateActCtxA(&manifest), &active));
  EXPECT_TRUE(SUCCEEDED(OleInitialize(nullptr)));
  Host host;
  host.item.Add("f");
  host.item.Add("create", [](Item::Call call) {
    CLSID id;
    void* object = nullptr;
    const HRESULT found = CLSIDFromProgID(call.arguments->rgvarg[0].bstrVal, &id);
    if (FAILED(found)) return found;
    const HRESULT made =
        CoCreateInstance(id, nullptr, CLSCTX_INPROC_SERVER, IID_IDispatch, &object);
    *call.result = Value(VT_DISPATCH, object);
    return made;
  });
  CheckTranscript("clients.txt", [&](const std::string& macro) { return host.Run(macro); });
  OleUninitialize();
  DeactivateActCtx(0, active);
}
