// SPDX-License-Identifier: MIT
#include "CallBenchmark.h"

#include <cstdio>
#include <cstdlib>
#include <iterator>

#include "BareObject.h"
#include "FakeEngine.h"
#include "Module.h"
#include "Section.h"

namespace {

constexpr char kRubyLoops[] = {
#embed "calls.rb" suffix(, 0)
};

bool Succeeded(HRESULT result, const char* what) {
  if (SUCCEEDED(result)) return true;
  std::fprintf(stderr, "%s failed: 0x%08lX\n", what, static_cast<unsigned long>(result));
  return false;
}

std::wstring Wide(const std::string& ascii) { return std::wstring(ascii.begin(), ascii.end()); }

// --- From scripts --------------------------------------------------------------------------------

constexpr int kTurns = 9;
constexpr int kScriptCalls = 2000;

std::string JScriptLoop(const std::string& call) {
  return "tarn.start(); for (var i = 0; i < " + std::to_string(kScriptCalls) + "; ++i) " + call +
         "; tarn.finish();";
}

bool CompareJScript(Section& section, Module& module, const std::string& call, double goal) {
  const std::string text = JScriptLoop(call);
  const std::wstring wide = Wide(text);
  const std::string macro = module.Macro("calls.js", text);
  BareObject bare;
  Comparison comparison("JScript, `" + call + "` : bare object", Comparison::Measure::kRatio, goal);
  const auto own = [&] {
    return module.TimeRun(macro) < 0 ? -1 : module.host.clock.Seconds() / kScriptCalls;
  };
  const auto peer = [&] {
    const bool ran = Succeeded(RunBare(L"JScript", bare, wide.c_str()), "the bare JScript");
    return ran ? bare.clock.Seconds() / kScriptCalls : -1;
  };
  if (!comparison.Measured(own, peer, kTurns)) return false;
  section.Add(comparison);
  return true;
}

// The macro measures both by itself, in one interpreter.
bool CompareRuby(Section& section) {
  // For the rest of the process: win32ole lets go of the object when Ruby collects it.
  static BareObject bare;
  if (!Succeeded(RegisterBareObject(bare), "registering the object")) return false;
  using Measure = Comparison::Measure;
  Comparison whole[] = {{"Ruby, `f(1, \"text\", 2.5)` : win32ole", Measure::kRatio, 1},
                        {"Ruby, `f()` : win32ole", Measure::kRatio, 1}};
  Comparison engine[] = {
      {"Ruby engine alone, `f(1, \"text\", 2.5)` : win32ole", Measure::kRatio, 1},
      {"Ruby engine alone, `f()` : win32ole", Measure::kRatio, 1}};
  Module module("");
  module.host.comparisons = whole;
  bare.comparisons = engine;
  if (module.TimeRun(module.Macro("calls.rbs", kRubyLoops)) < 0 ||
      !Succeeded(RunBare(L"RubyScript", bare, Wide(kRubyLoops).c_str()), "the bare Ruby"))
    return false;
  for (const Comparison& each : whole) section.Add(each);
  for (const Comparison& each : engine) section.Add(each);
  return true;
}

// --- Straight ------------------------------------------------------------------------------------

constexpr int kDirectCalls = 2000;

bool Lookup(IDispatch& object) {
  LPOLESTR names[] = {const_cast<LPOLESTR>(L"f")};
  DISPID id = 0;
  return object.GetIDsOfNames(IID_NULL, names, 1, LOCALE_USER_DEFAULT, &id) == S_OK && id == kF;
}

// Arguments in COM's order: the last first.
bool Invoke(IDispatch& object, DISPID id, std::vector<VARIANT>& arguments) {
  DISPPARAMS parameters = {arguments.data(), nullptr, static_cast<UINT>(arguments.size()), 0};
  VARIANT result = {};
  const HRESULT outcome = object.Invoke(id, IID_NULL, LOCALE_USER_DEFAULT, DISPATCH_METHOD,
                                        &parameters, &result, nullptr, nullptr);
  const bool right = outcome == S_OK && result.vt == (id == kText ? VT_BSTR : VT_I4);
  VariantClear(&result);
  return right;
}

struct DirectCase {
  const char* title;
  bool lookup;
  DISPID id;  // kUnknown: no call
  std::vector<VARIANT> arguments;
};

// Seconds of one such call; negative when it failed.
double TimeDirect(IDispatch& object, DirectCase& each) {
  bool succeeded = true;
  const double seconds = SecondsPerCall(kDirectCalls, [&] {
    if (each.lookup) succeeded &= Lookup(object);
    if (each.id != kUnknown) succeeded &= Invoke(object, each.id, each.arguments);
  });
  return succeeded ? seconds : -1;
}

bool CompareDirect(Section& section, IDispatch& tarn) {
  VARIANT one = Value(VT_I4, 1);
  VARIANT real = Value(VT_R8, 2.5);
  VARIANT text = Value(VT_BSTR, SysAllocString(L"text"));
  DirectCase cases[] = {
      {"lookup and `f()`", true, kF, {}},
      {"lookup and `f(1, \"text\", 2.5)`", true, kF, {real, text, one}},
      {"lookup alone", true, kUnknown, {}},
      {"`f()` alone", false, kF, {}},
      {"`f(1)` alone", false, kF, {one}},
      {"`f(\"text\")` alone", false, kF, {text}},
      {"`f(2.5)` alone", false, kF, {real}},
      {"`text()` alone, a text result", false, kText, {}},
  };
  BareObject bare;
  bool succeeded = true;
  for (DirectCase& each : cases) {
    Comparison comparison("C++, " + std::string(each.title) + " : bare object");
    if (!comparison.Measured([&] { return TimeDirect(tarn, each); },
                             [&] { return TimeDirect(bare, each); }, 5 * kTurns)) {
      std::fprintf(stderr, "%s failed\n", each.title);
      succeeded = false;
      break;
    }
    section.Add(comparison);
  }
  SysFreeString(text.bstrVal);
  return succeeded;
}

void* volatile block;  // keeps the compiler from leaving an allocation out

void PrintPart(Section& section, const char* name, void (*part)()) {
  std::vector<double> seconds;
  for (int round = 0; round < 9 * Comparison::kRounds; ++round)
    seconds.push_back(SecondsPerCall(kDirectCalls, part));
  section.Print("| " + std::string(name) + " | " + TimeText(Median(seconds)) + " |\n");
}

void PrintParts(Section& section) {
  section.Print("\nWhat its parts cost by themselves:\n\n| part | time |\n|---|--:|\n");
  PrintPart(section, "`malloc` and `free` of an argument's 48 bytes", [] {
    block = std::malloc(48);
    std::free(block);
  });
  PrintPart(section, "the same of three arguments and their texts, all six blocks at once", [] {
    void* blocks[6];
    for (int i = 0; i < 6; ++i) blocks[i] = std::malloc(i % 2 ? 13 : 48);
    for (void* each : blocks) std::free(each);
    block = blocks[0];
  });
  PrintPart(section, "`malloc` and `free` of a list of 50 slots, zeroed", [] {
    block = std::calloc(50, 4);
    std::free(block);
  });
  PrintPart(section, "an integer as text by the C runtime", [] {
    char text[64];
    _snprintf(text, sizeof text, "%ld", 1L);
    block = text;
  });
  PrintPart(section, "a real as text by the C runtime", [] {
    char text[400];
    _snprintf(text, sizeof text, "%lf", 2.5);
    block = text;
  });
  PrintPart(section, "`SysAllocString` and `SysFreeString` of four characters", [] {
    const BSTR text = SysAllocString(L"text");
    SysFreeString(text);
  });
  PrintPart(section, "`SetErrorInfo(0, nullptr)`", [] { SetErrorInfo(0, nullptr); });
}

}  // namespace

bool CompareCalls(Section& section) {
  section.Begin(
      "Calls from a script",
      "One call of a macro function, its share of the script's loop included: by "
      "`tarn` through the module, and of a COM object that converts nothing in the same "
      "script engine. \"Ruby engine alone\" is that object as `tarn`, without the module. "
      "An argument is made in the block of the last call's; its text takes a block of its own, "
      "whose cost is among the parts of the next section.");
  section.Head();
  Module module(JScriptDescription());
  return CompareJScript(section, module, "tarn.f()", 1.5) &&
         CompareJScript(section, module, "tarn.f(1, \"text\", 2.5)", 2) && CompareRuby(section);
}

bool CompareDispatch(Section& section) {
  section.Begin(
      "A call without a script",
      "The same object called from C++ by `GetIDsOfNames` and `Invoke`. The bare object's "
      "calls are two virtual calls; the differences are the module's share of a call.");
  section.Head();
  RegisterFakeEngine();
  Module module(kShortDescription);
  bool succeeded = false;
  on["engine: SetScriptState 2"] = [&] { succeeded = CompareDirect(section, *Item()); };
  const bool ran = module.TimeRun(module.Macro("empty.js", "")) >= 0;
  on.clear();
  PrintParts(section);
  return ran && succeeded;
}
