// SPDX-License-Identifier: MIT
// The interpreter's life in a process, in a separate program: the time before its start and, at the
// end, its loss.
#include "EngineHost.h"

#include <thread>

TEST(Life, KeepsTheLibraryFromItsStartOn) {
  const auto canUnload = reinterpret_cast<HRESULT(WINAPI*)()>(EngineExport("DllCanUnloadNow"));
  EXPECT_EQ(S_OK, canUnload());
  IClassFactory* factory = nullptr;
  ASSERT_EQ(S_OK,
            GetClassObject(kEngineClass, IID_IClassFactory, reinterpret_cast<void**>(&factory)));
  EXPECT_EQ(S_FALSE, canUnload());
  EXPECT_EQ(S_OK, factory->LockServer(TRUE));
  factory->Release();
  EXPECT_EQ(S_FALSE, canUnload());
  EXPECT_EQ(S_OK, factory->LockServer(FALSE));
  EXPECT_EQ(S_OK, canUnload());
  Host host;
  host.Open();
  EXPECT_EQ(S_FALSE, canUnload());
  host.Close();
  EXPECT_EQ(S_OK, canUnload());
  EXPECT_EQ("", host.Run("1"));
  EXPECT_EQ(S_FALSE, canUnload());
  for (int i = 0; i < 5; ++i) FreeLibrary(GetModuleHandleA("rubyscript.dll"));
  ASSERT_NE(nullptr, GetModuleHandleA("rubyscript.dll"));
  EXPECT_EQ("", host.Run("1"));

  const char* const copy = "another-rubyscript.dll";
  ASSERT_TRUE(CopyFileA(RUBYSCRIPT_DLL, copy, FALSE));
  const HMODULE dll = LoadLibraryA(copy);
  const FARPROC get = GetProcAddress(dll, "DllGetClassObject");
  ASSERT_NE(nullptr, get);
  host.Create(reinterpret_cast<decltype(&DllGetClassObject)>(reinterpret_cast<void*>(get)));
  host.script->SetScriptSite(&host);
  host.parse->InitNew();
  EXPECT_EQ(kReported, host.Parse("1"));
  host.Close();
  EXPECT_EQ(
      "error: Another copy of the Ruby engine runs in this process. Use one copy of "
      "rubyscript.dll.",
      TakeLog());
  FreeLibrary(dll);
  DeleteFileA(copy);
}

// Runs in a separate process. The id of an ended thread may be given to the next one.
TEST(Thread, HasEnded) {
  const char* const ended =
      "error: The thread that ran the first Ruby macro has ended. Restart the program to run Ruby "
      "macros again.";
  Host host, late;
  std::thread([&] { EXPECT_EQ("", host.Run("1")); }).join();
  for (int i = 0; i < 20; ++i) std::thread([&] { EXPECT_EQ(ended, late.Run("1")); }).join();
  EXPECT_EQ(ended, late.Run("1"));
}

// The guard of the host that called last catches the fault; no other host waits forever. The
// environment sets the place in Ruby where it happens.
TEST(Life, EndsWithAFaultInsideOfRuby) {
  const char* const place = std::getenv("SCRIPTRUBY_TEST_PLACE");
  const std::string loses =
      "begin\n"s + (place ? place : "1.then") +
      " {\n"
      "  code = RubyVM::InstructionSequence.compile('1').to_binary.b\n"
      "  code[28, 4] = [0x70000000].pack('V') # where its list of methods is\n"
      "  RubyVM::InstructionSequence.load_from_binary(code).eval\n"
      "}.then { |it| Thread === it ? it.join : Fiber === it ? it.resume : nil }\n"
      "rescue Exception\nensure\n  @item.f\nend";
  Host outer, inner, early, late;
  inner.item.Add("f");
  outer.item.Does("nest", [&] {
    inner.Open();
    inner.Parse(loses);
    EXPECT_EQ(EXCEPTION_ACCESS_VIOLATION, Guarded([&] { inner.Start(); }));
    inner.Close();
  });
  early.Open();
  EXPECT_EQ(S_OK, early.Parse("def f = 1"));
  EXPECT_EQ(S_OK, early.Start());
  // What Ruby held of the host's objects is lost with it.
  const std::string left = "left over: 0 of the engine, 0 of the site, 1 of the item";
  EXPECT_EQ("item.nest(); " + left + "; 80004004; " + left,
            outer.Run("begin; @item.nest; rescue Exception; end; @item.nest"));
  const std::string lost =
      "error: Ruby was lost to a fault (exception 0xC0000005) in an earlier macro. "
      "Restart the program to run Ruby macros again.";
  EXPECT_EQ(kReported, early.Parse("f"));
  early.Close();
  EXPECT_EQ(lost + "; " + left, TakeLog());
  for (int i = 0; i < 2; ++i) EXPECT_EQ(lost, late.Run("1"));
  late.errorAnswer = E_FAIL;
  EXPECT_EQ(lost + "; 80020009", late.Run("1"));
}
