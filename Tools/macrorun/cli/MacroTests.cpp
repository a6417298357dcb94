// SPDX-License-Identifier: MIT
#include "cli/MacroTests.h"

#include <algorithm>
#include <map>
#include <memory>

#include "cli/TestFolder.h"
#include "host/EngineWatch.h"
#include "host/Language.h"
#include "host/MacroRun.h"
#include "platform/Encoding.h"
#include "platform/Files.h"
#include "report/TextDiff.h"

namespace fs = std::filesystem;

namespace {

struct Test : MacroTest {
  enum class State { kNotBegun, kFailed, kDiffers, kPassed, kPromoted };

  explicit Test(const MacroTest& found) : MacroTest(found) {}
  // Whether the macro ended without an error, so that `made` is complete.
  bool Ran() const { return state == State::kDiffers || state == State::kPassed; }

  State state = State::kNotBegun;
  ExitCode code = kSuccess;
  std::string made;
};

bool Exists(const fs::path& path) {
  std::error_code error;
  return fs::exists(path, error);
}

// Runs the macros of one language. One object at a time.
struct LanguageHost {
  LanguageHost(const Options& options, const Language& hostLanguage)
      : language(hostLanguage), module(options.module, &language), engines(language.engine) {}

  const Language language;
  ScriptModule module;
  EngineWatch engines;  // destroyed before the module, which its engines point to
};

class MacroTests {
 public:
  MacroTests(const Options& given, Reporter& runReporter);

  ExitCode Run();

 private:
  using State = Test::State;
  using Group = std::vector<Test*>;

  bool RunAll();
  void RunOne(Test& test);
  ExitCode RunGuarded(Test& test);
  ExitCode Judge(Test& test);
  void Compare(const Test& test, bool there, const std::string& text);
  void UseLanguageOf(const fs::path& macro);
  void Promote();
  void PromoteGroup(const Group& group);
  ExitCode Write(const fs::path& file, const std::string& text);
  void Summarize();
  std::string Count(State state, const char* what) const;

  Options options;  // with the macro of the current test
  Reporter& reporter;
  std::vector<Test> tests;
  CallProfile profile;
  std::wstring extension;  // of the host's language
  std::unique_ptr<LanguageHost> host;
};

MacroTests::MacroTests(const Options& given, Reporter& runReporter)
    : options(given), reporter(runReporter) {
  const TestFolder folder(given.test);
  for (const MacroTest& found : folder.tests) tests.emplace_back(found);
  for (const fs::path& text : folder.orphans)
    reporter.Note(ToUtf8(text.generic_wstring()) + " belongs to no macro");
}

ExitCode MacroTests::Run() {
  const bool whole = RunAll();
  // Only after all tests: several languages can share one NAME.out.
  if (options.promote && whole) Promote();
  Summarize();
  if (options.run.profile) reporter.Profile(profile.Table());
  ExitCode worst = kSuccess;
  for (const Test& test : tests) worst = std::max(worst, test.code);
  return worst;
}

// False when a stop or a fault ended the tests.
bool MacroTests::RunAll() {
  std::size_t number = 0;
  for (Test& test : tests) {
    const std::string name = ToUtf8(test.macro), textCase = ToUtf8(test.textCase);
    std::string shown = name;
    if (!textCase.empty()) shown.append(" (").append(textCase).append(")");
    reporter.Progress(++number, tests.size(), shown);
    UseLanguageOf(test.macro);
    reporter.SetMacro(name, textCase);
    RunOne(test);
    reporter.SetMacro({}, {});
    if (test.code == kStopped || test.code == kFault) return false;
  }
  return true;
}

void MacroTests::UseLanguageOf(const fs::path& macro) {
  const std::wstring wanted = Folded(macro.extension());
  if (host && wanted == extension) return;
  host.reset();
  host = std::make_unique<LanguageHost>(options, ChooseLanguage(options.language, macro));
  extension = wanted;
}

void MacroTests::RunOne(Test& test) {
  test.state = State::kFailed;
  test.code = RunGuarded(test);
  if (test.Ran()) return;
  // The error names the macro, but not the case.
  if (!test.textCase.empty()) reporter.Note("failed");
  reporter.TestEnd(false, {});
}

// If one test fails, the others still run.
ExitCode MacroTests::RunGuarded(Test& test) try {
  options.run.macro = test.macro;
  const fs::path input = Exists(test.Input()) ? test.Input() : fs::path();
  Editor editor(Document(ReadInput(input)), input);
  RequireMacro(test.macro);
  RunContext context{options.run, host->module, host->language, host->engines.Running(),
                     reporter,    profile};
  const ExitCode code = RunMacro(context, editor);
  if (code != kSuccess) return code;
  test.made = editor.First().Bytes();
  return Judge(test);
} catch (const UsageError& error) {
  reporter.Error(PlainDiagnostic("file", {}, error.what()));
  return kWrongUsage;
}

ExitCode MacroTests::Judge(Test& test) {
  const bool there = Exists(test.Expected());
  const std::string text = ReadInput(there ? test.Expected() : fs::path());
  const bool passed = there && text == test.made;
  test.state = passed ? State::kPassed : State::kDiffers;
  if (passed)
    reporter.TestEnd(true, {});
  else
    Compare(test, there, text);
  return passed ? kSuccess : kMacroFailed;
}

void MacroTests::Compare(const Test& test, bool there, const std::string& text) {
  const std::string name = ToUtf8(test.Expected().filename());
  const std::string missing = "no " + name + (options.promote ? "" : " (create it with --promote)");
  reporter.Error(
      PlainDiagnostic("test", test.macro, there ? "the text differs from " + name : missing));
  reporter.TestEnd(false, CompareTexts(name, text, ToUtf8(test.macro.filename()), test.made));
}

void MacroTests::Promote() {
  std::map<std::wstring, Group> groups;
  for (Test& test : tests)
    if (test.Ran()) groups[Folded(test.Expected())].push_back(&test);
  for (const auto& [name, group] : groups)
    if (std::any_of(group.begin(), group.end(),
                    [](const Test* test) { return test->state == State::kDiffers; }))
      PromoteGroup(group);
}

// Tests with the same NAME.out, which at least one of them does not match.
void MacroTests::PromoteGroup(const Group& group) {
  const fs::path file = group.front()->Expected();
  std::string names;
  bool agree = true;
  for (const Test* test : group) {
    names += (names.empty() ? "" : ", ") + ToUtf8(test->macro.filename());
    agree = agree && test->made == group.front()->made;
  }
  if (!agree)
    return reporter.Error(
        PlainDiagnostic("test", file, "not promoted: its macros make different texts: " + names));
  const ExitCode code = Write(file, group.front()->made);
  for (Test* test : group) {
    if (test->state != State::kDiffers) continue;
    test->code = code;
    if (code == kSuccess) test->state = State::kPromoted;
  }
}

ExitCode MacroTests::Write(const fs::path& file, const std::string& text) try {
  RequireReplaceable(file, false);
  ReplaceFileBytes(file, text);
  reporter.Note("promoted " + ToUtf8(file));
  return kSuccess;
} catch (const UsageError& error) {
  reporter.Error(PlainDiagnostic("file", {}, error.what()));
  return kWrongUsage;
}

void MacroTests::Summarize() {
  for (Test& test : tests)
    if (test.state == State::kDiffers) test.state = State::kFailed;
  std::string summary = Count(State::kPassed, " passed, ") + Count(State::kFailed, " failed");
  if (options.promote) summary += ", " + Count(State::kPromoted, " promoted");
  const std::string rest = Count(State::kNotBegun, " not started");
  reporter.Note(summary + (rest.starts_with("0 ") ? "" : ", " + rest));
}

std::string MacroTests::Count(State state, const char* what) const {
  return std::to_string(std::count_if(tests.begin(), tests.end(),
                                      [state](const Test& test) { return test.state == state; })) +
         what;
}

}  // namespace

ExitCode RunMacroTests(const Options& options, Reporter& reporter) {
  return MacroTests(options, reporter).Run();
}
