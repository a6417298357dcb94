// SPDX-License-Identifier: MIT
#include "MacroTests.h"

#include <windows.h>

#include <algorithm>
#include <map>
#include <memory>
#include <tuple>

#include "Encoding.h"
#include "Files.h"
#include "Language.h"
#include "MacroRun.h"
#include "TextDiff.h"

namespace fs = std::filesystem;

namespace {

struct Test {
  enum class State { kNotBegun, kFailed, kDiffers, kPassed, kPromoted };

  fs::path Beside(const char* extension) const {
    return fs::path(macro).replace_extension(extension);
  }
  fs::path Input() const { return Beside(".in"); }
  fs::path Expected() const { return Beside(".out"); }
  // Whether `made` is the macro's whole work.
  bool Ran() const { return state == State::kDiffers || state == State::kPassed; }

  fs::path macro;
  State state = State::kNotBegun;
  ExitCode code = kSuccess;
  std::string made;
};

// The same for all spellings of a file's name.
std::wstring Folded(const fs::path& path) {
  std::wstring text = path.wstring();
  CharLowerBuffW(text.data(), static_cast<DWORD>(text.size()));
  return text;
}

bool Exists(const fs::path& path) {
  std::error_code error;
  return fs::exists(path, error);
}

// By language, then by name.
std::vector<Test> TestsIn(const fs::path& folder) {
  std::vector<Test> tests;
  std::error_code error;
  for (fs::directory_iterator entry(folder, error), end; !error && entry != end;
       entry.increment(error)) {
    std::error_code ignored;
    if (!HasLanguage(entry->path()) || entry->is_directory(ignored)) continue;
    tests.emplace_back().macro = (folder / entry->path().filename()).generic_wstring();
  }
  if (error)
    throw UsageError("cannot read the folder " + ToUtf8(folder) + " (--test): " + error.message());
  if (tests.empty()) throw UsageError("no macros in " + ToUtf8(folder) + " (--test)");
  const auto key = [](const Test& test) {
    return std::make_tuple(Folded(test.macro.extension()), Folded(test.macro));
  };
  std::sort(tests.begin(), tests.end(),
            [&](const Test& left, const Test& right) { return key(left) < key(right); });
  return tests;
}

// What runs the macros of one language; one at a time.
struct LanguageHost {
  LanguageHost(const Options& options, const Language& language)
      : module(options.module, &language), engines(language.engine) {}

  ScriptModule module;
  EngineWatch engines;  // goes before the module, whose engines it may hold
};

class MacroTests {
 public:
  MacroTests(const Options& given, Reporter& runReporter)
      : options(given), reporter(runReporter), tests(TestsIn(given.test)) {}

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
  void Report(const char* kind, const fs::path& file, std::string message);

  Options options;  // with the macro of the present test
  Reporter& reporter;
  std::vector<Test> tests;
  CallProfile profile;
  std::wstring extension;  // the host's
  std::unique_ptr<LanguageHost> host;
};

ExitCode MacroTests::Run() {
  const bool whole = RunAll();
  // The other half of a test in two languages may be among those not begun.
  if (options.promote && whole) Promote();
  Summarize();
  if (options.profile) reporter.Profile(profile.Table());
  ExitCode worst = kSuccess;
  for (const Test& test : tests) worst = std::max(worst, test.code);
  return worst;
}

// Whether it came to the end.
bool MacroTests::RunAll() {
  std::size_t number = 0;
  for (Test& test : tests) {
    const std::string name = ToUtf8(test.macro);
    reporter.Progress(++number, tests.size(), name);
    UseLanguageOf(test.macro);
    reporter.SetMacro(name);
    RunOne(test);
    reporter.SetMacro({});
    if (test.code == kStopped || test.code == kFault) return false;
  }
  return true;
}

void MacroTests::UseLanguageOf(const fs::path& macro) {
  const std::wstring wanted = Folded(macro.extension());
  if (host && wanted == extension) return;
  host.reset();
  host = std::make_unique<LanguageHost>(options, ChooseLanguage(options, macro));
  extension = wanted;
}

void MacroTests::RunOne(Test& test) {
  test.state = State::kFailed;
  test.code = RunGuarded(test);
  if (!test.Ran()) reporter.TestEnd(false, {});
}

// A file that cannot be read keeps no other test from its turn.
ExitCode MacroTests::RunGuarded(Test& test) try {
  options.macro = test.macro;
  const fs::path input = Exists(test.Input()) ? test.Input() : fs::path();
  Editor editor(Document(ReadInput(input)), input);
  RunSurroundings surroundings{options, host->module, host->engines, reporter, profile};
  const ExitCode code = RunMacro(surroundings, editor);
  if (code != kSuccess) return code;
  test.made = editor.First().Bytes();
  return Judge(test);
} catch (const UsageError& error) {
  Report("file", {}, error.what());
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
  const std::string missing = "no " + name + (options.promote ? "" : "; --promote writes it");
  Report("test", test.macro, there ? "its text is not that of " + name : missing);
  std::vector<DiffLine> diff;
  if (there || options.promote)
    diff = CompareTexts(name, text, ToUtf8(test.macro.filename()), test.made);
  reporter.TestEnd(false, diff);
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

// Tests with the same NAME.out, which some of them do not make.
void MacroTests::PromoteGroup(const Group& group) {
  const fs::path file = group.front()->Expected();
  std::string names;
  bool agree = true;
  for (const Test* test : group) {
    names += (names.empty() ? "" : ", ") + ToUtf8(test->macro.filename());
    agree = agree && test->made == group.front()->made;
  }
  if (!agree) return Report("test", file, "not promoted, since its macros disagree: " + names);
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
  Report("file", {}, error.what());
  return kWrongUsage;
}

void MacroTests::Summarize() {
  for (Test& test : tests)
    if (test.state == State::kDiffers) test.state = State::kFailed;
  std::string summary = Count(State::kPassed, " passed, ") + Count(State::kFailed, " failed");
  if (options.promote) summary += ", " + Count(State::kPromoted, " promoted");
  const std::string rest = Count(State::kNotBegun, " not begun");
  reporter.Note(summary + (rest.starts_with("0 ") ? "" : ", " + rest));
}

std::string MacroTests::Count(State state, const char* what) const {
  return std::to_string(std::count_if(tests.begin(), tests.end(),
                                      [state](const Test& test) { return test.state == state; })) +
         what;
}

void MacroTests::Report(const char* kind, const fs::path& file, std::string message) {
  ErrorReport report;
  report.kind = kind;
  report.file = ToUtf8(file);
  report.message = std::move(message);
  reporter.Error(std::move(report));
}

}  // namespace

ExitCode RunMacroTests(const Options& options, Reporter& reporter) {
  return MacroTests(options, reporter).Run();
}
