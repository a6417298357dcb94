// SPDX-License-Identifier: MIT
// The module with the Ruby engine that ships: keyboard macros, text, stops and faults, nested runs.
#include "ModuleTest.h"
#include "Resources.h"

class RubyTest : public ModuleTest {
 protected:
  static void SetUpTestSuite() { cookie = ActivateRuby(); }
  static void TearDownTestSuite() { DeactivateActCtx(0, cookie); }
  RubyTest() { Describe(""); }

  int RunMacro(const std::string& text) {
    WriteBytes(macroPath, text);
    return Run();
  }

  static inline ULONG_PTR cookie;
};

// As the editor composes it from the templates of `version`.
static std::string KeyboardMacro(const std::string& typed) {
  char record[392] = {'\x88', 1};  // its size
  EXPECT_TRUE(CallExport<bool>(dll, "version", &record[0], ""));
  std::string text;
  for (char ch : typed)
    text += ch == '\n'   ? record + 335
            : ch == '\'' ? record + 368
            : ch == '"'  ? record + 379
                         : ""s + ch;
  char line[600];
  snprintf(line, sizeof line, record + 212, text.c_str());
  return record + 85 + ""s + line + "\n" + (record + 161);
}

TEST_F(RubyTest, KeyboardMacrosAndText) {
  const std::string typed = "It's \"quoted\",\n50 % \t\xC3\xA4 \xE2\x82\xAC \xE6\x97\xA5 #1 + {x}";
  on["call 9"] = [&] {
    void* argument = At<void**>(host.context, 51 + 16)[0];
    EXPECT_EQ(typed, At<char*>(argument, 24 + 8));
  };
  RunMacro(KeyboardMacro(typed));
  on.erase("call 9");
  // Every byte there and back.
  std::string bytes;
  for (int byte = 1; byte < 256; ++byte) bytes += static_cast<char>(byte);
  on["call 7"] = [&] { host.AnswerTexts({bytes}); };
  RunMacro(
      "\xEF\xBB\xBFtext = @tarn.f(1.5, :symbol, true, 2**40)\n"
      "@tarn.g(text, 'Gr\xC3\xBC\xC3\x9F"
      "e'.length, 'Gr\xC3\xBC\xC3\x9F"
      "e'.upcase, -1, nil)\n"
      "@tarn.g(text.bytes == (1..255).to_a, text.encoding.name)\n");
  RunMacro("x = \n");
  RunMacro("def deeper = @tarn.f(Object.new)\n\ndeeper\n");
  for (const char* argument : {"[1]", "nil, 1", "@tarn, 1"})
    RunMacro("@tarn.f(" + std::string(argument) + ")\n");
  RunMacro("@tarn.nothing('a')\n");
  RunMacro("exit\n");
  RunMacro("abort\n");
}

// Fails when an earlier macro has left something.
static const std::string kClean =
    "raise 'not clean' if defined?(Leak) || respond_to?(:leak, true) || @leak || $leak\n"
    "@leak = $leak = Leak = 1\n"
    "def leak = 1\n"
    "begin\n"
    "  @tarn.f(1)\n"
    "rescue Exception\n"
    "  @tarn.g('rescued')\n"
    "ensure\n"
    "  $ended = $ended.to_i + 1\n"
    "  @tarn.g('the last call') if $!.nil?\n"
    "end\n";

TEST_F(RubyTest, NestedThreeDeepWithAStopOrAFaultAtEachDepth) {
  for (int depth = 0; depth < 3; ++depth)
    for (bool stop : {true, false}) {
      Log("--- "s + (stop ? "stop" : "fault") + " at depth " + std::to_string(depth));
      int level = 0;
      on["call 7"] = [&] {
        const int mine = level++;
        void* const engine = host.Engine();
        if (mine < 2) Run();
        host.Engine() = engine;
        if (mine != depth) return;
        if (stop) Stop(engine);
        *reinterpret_cast<volatile int*>(8) = 1;
      };
      RunMacro(kClean);
      on.erase("call 7");
      Run();
    }
}

// The next macro is right each time, and the process does not grow: at a tenth and at the end.
TEST_F(RubyTest, StopsFaultsAndRunsLevelOff) {
  const char* const setting = std::getenv("SCRIPTRUBY_TEST_FAULTS");
  const int repeats = setting ? std::max(20, std::atoi(setting)) : 1000;
  const std::pair<const char*, std::function<void()>> ends[] = {
      {"stops", [&] { Stop(host.Engine()); }},
      {"faults", [] { *reinterpret_cast<volatile int*>(8) = 1; }},
      {"runs", [] {}}};
  WriteBytes(macroPath, kClean);
  for (const auto& [name, end] : ends) {
    const bool leaves = name != "runs"s;
    const int count = leaves ? repeats : 10 * repeats;
    Resources early = {};
    for (int i = 0; i < count; ++i) {
      muted = true;
      on["call 7"] = end;
      ASSERT_EQ(leaves ? -1 : 1, Run()) << name << " " << i;
      on.erase("call 7");
      if (leaves) ASSERT_EQ(1, Run()) << name << " " << i;
      if (i + 1 == count / 10) early = Used();
    }
    const Resources late = Used();
    printf("%d %s: %u KiB and %u handles at a tenth, %u KiB and %u handles at the end\n", count,
           name, early.kilobytes, early.handles, late.kilobytes, late.handles);
    EXPECT_LE(late.handles, early.handles + 4) << name;
    EXPECT_LE(late.kilobytes, early.kilobytes + early.kilobytes / 100 + 512) << name;
  }
}
