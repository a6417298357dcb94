// SPDX-License-Identifier: MIT
// What one macro leaves to the next one, to the macro around it and to the host: nothing. And where
// its output goes.
#include <locale.h>

#include "EngineHost.h"

// The last line shows the effects of the lines before it; no other engine may see them.
TEST(GlobalsSnapshot, EachEngineHasItsOwn) {
  Host host, inner;
  host.item.Add("f");
  inner.item.Add("f");
  CheckTranscript("traces.txt", [&](const std::string& macro) {
    const size_t end = macro.rfind('\n', macro.size() - 2);
    const std::string makes = macro.substr(0, end);
    const std::string show =
        "\n@item.f((" + macro.substr(end + 1, macro.size() - end - 2) + ").inspect)";
    const std::string fresh = host.Run(show), own = host.Run(makes + show);
    EXPECT_NE(fresh, own) << makes;
    EXPECT_EQ(fresh, host.Run(show)) << makes;
    std::string inside;
    host.item.Does("nest", [&] { TakeLog(), inside = inner.Run(show), inner.Run(makes); });
    const std::string after = host.Run(makes + "\n@item.nest" + show);
    if (makes.find("# of the process") == std::string::npos) {
      EXPECT_EQ(fresh, inside) << makes;
      EXPECT_EQ(own, after) << makes;
    }
    EXPECT_EQ(fresh, host.Run(show)) << makes;
    return own;
  });
}

TEST(GlobalsSnapshot, DataOfNestedMacros) {
  Host outer, inner;
  for (Host* host : {&outer, &inner}) host->item.Add("f");
  outer.item.Does("nest", [&] { Log(inner.Run("@item.f DATA.read\n__END__")); });
  EXPECT_EQ("item.nest(); item.f(''); item.f('own\\x0A')",
            outer.Run("@item.nest; @item.f DATA.read\n__END__\nown\n"));
}

// The engine is entered again while its macro waits for the host.
TEST(GlobalsSnapshot, ReentersTheSameEngine) {
  Host host;
  host.item.Add("f");
  host.item.Does("parse",
                 [&] { EXPECT_EQ(S_OK, host.Parse("@x += 1; def more = 3; @item.f @x")); });
  host.item.Does("fails", [&] { EXPECT_EQ(kReported, host.Parse("raise 'inside'")); });
  host.item.Add("call", [&](Item::Call call) {
    IDispatch* functions = nullptr;
    EXPECT_EQ(S_OK, host.script->GetScriptDispatch(nullptr, &functions));
    LPOLESTR name = const_cast<LPOLESTR>(L"again");
    DISPID id = 0;
    EXPECT_EQ(S_OK, functions->GetIDsOfNames(IID_NULL, &name, 1, 0, &id));
    const HRESULT result = functions->Invoke(id, IID_NULL, 0, DISPATCH_METHOD, call.arguments,
                                             call.result, call.exception, nullptr);
    functions->Release();
    return result;
  });
  EXPECT_EQ(
      "item.parse(); item.f(I4 2); item.fails(); error: inside (RuntimeError); item.call(I4 2); "
      "item.call(I4 1); item.call(I4 0); item.f('done'); item.f([I4 3, I4 2])",
      host.Run("@x = 1\ndef again(n) = n > 0 ? @item.call(n - 1) : (@item.f('done'); more)\n"
               "@item.parse; @item.fails; @item.f([@item.call(2), @x])"));
}

TEST(GlobalsSnapshot, Output) {
  Host host, mute;
  host.item.Add("message");
  CheckTranscript("output.txt", [&](const std::string& macro) { return host.Run(macro); });
  // Without such a function nothing is asked unless something is said.
  EXPECT_EQ("", mute.Run("$stdout; STDERR; print ''"));
  EXPECT_EQ("item.message?", mute.Run("puts '(on standard output)'; $stderr.print ''; puts"));
}

// --- The process ---------------------------------------------------------------------------------

static std::string ProcessState() {
  unsigned short x87 = 0;
  unsigned int sse = 0;
  asm volatile("fnstcw %0" : "=m"(x87));
  asm volatile("stmxcsr %0" : "=m"(sse));
  char folder[MAX_PATH] = "";
  GetCurrentDirectoryA(MAX_PATH, folder);
  return Hex(x87) + " " + Hex(sse & ~0x3F) + " " + folder + " " + setlocale(LC_ALL, nullptr);
}

// What else belongs to the process, ProcessStateSnapshot is tested for by itself.
TEST(GlobalsSnapshot, LeavesTheProcessAlone) {
  constexpr unsigned short kX87 = 0x0A3F;  // 53 bits, upwards, all masked
  constexpr unsigned int kSse = 0x5F80;    // upwards
  Host host;
  std::string before;
  const auto hostState = [&] {
    SetCurrentDirectoryA("C:\\windows");
    setlocale(LC_ALL, "English_United States.1252");
    asm volatile("fldcw %0" : : "m"(kX87));
    asm volatile("ldmxcsr %0" : : "m"(kSse));
    before = ProcessState();
  };
  host.item.Does("check", [&] {
    EXPECT_EQ(before.substr(0, 17), ProcessState().substr(0, 17));  // of arithmetic
    asm volatile("fninit");
  });
  host.item.Does("stop",
                 [&] { host.script->InterruptScriptThread(SCRIPTTHREADID_BASE, nullptr, 0); });
  host.item.Add("f");
  const std::string arithmetic =
      "@item.f [0.1 + 0.2, 1.0 / 3, 2.0 / 3, 1e16 + 1, Math.sqrt(2), '0.1'.to_f * 3].to_s\n";
  hostState();
  for (const char* ending : {"", "raise 'x'", "exit", "@item.stop"}) {
    const std::string log = host.Run(arithmetic + "@item.check\n" + arithmetic +
                                     "Dir.chdir('C:/'); require 'json'\n" + ending);
    asm volatile("fldcw %0" : : "m"(kX87));
    const std::string numbers =
        "item.f('[0.30000000000000004, 0.3333333333333333, 0.6666666666666666, 1.0e+16, "
        "1.4142135623730951, 0.30000000000000004]')";
    EXPECT_EQ(numbers + "; item.check(); " + numbers, log.substr(0, 2 * numbers.size() + 16))
        << ending;
    EXPECT_EQ(before, ProcessState()) << ending;
  }
  setlocale(LC_ALL, "C");
  asm volatile("fninit");
}
