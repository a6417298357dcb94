// SPDX-License-Identifier: MIT
// Macros made from random recordings have the effect of the steps.
//
// SCRIPTRUBY_TEST_RECORDINGS is the number for each language (1000; for VBScript, whose engine
// starts slowly, 250). SCRIPTRUBY_TEST_SEED is the seed of the first one.
#include <windows.h>

#include <gtest/gtest.h>

#include <cstdlib>
#include <fstream>
#include <nlohmann/json.hpp>
#include <random>

#include "FunctionTable.h"
#include "document/Characters.h"
#include "host/EngineWatch.h"
#include "host/MacroRun.h"
#include "platform/ProgramFile.h"
#include "recording/LanguageTemplates.h"
#include "recording/MacroComposer.h"
#include "recording/Recording.h"

namespace fs = std::filesystem;
using nlohmann::json;

namespace {

unsigned Setting(const char* name, unsigned otherwise) {
  const char* const value = std::getenv(name);
  return value ? static_cast<unsigned>(std::strtoul(value, nullptr, 10)) : otherwise;
}

json Bytes(const std::string& text) {
  json bytes = json::array();
  for (const char byte : text) bytes.push_back(static_cast<unsigned char>(byte));
  return {{"bytes", bytes}};
}

// Generates steps and applies each to a document. A wrong call is replaced by one that changes
// nothing.
class RandomRecording {
 public:
  RandomRecording(std::uint32_t seed, const std::string& language)
      : engine(seed),
        encoding(language == "rbs" ? ResultEncoding::kBytes : ResultEncoding::kCharacters),
        loneReturns(language != "vbs"),
        undoes(Below(2) == 0),
        start(Text(Below(8))),
        editor(Document(start)) {
    editor.BeginStep();
    for (std::size_t count = Below(14); steps.size() < count;) AddStep();
    EndTyping();
    editor.EndStep();
  }

 private:
  // Initialised first: the others use them.
  std::mt19937 engine;
  const ResultEncoding encoding;
  const bool loneReturns;
  const bool undoes;  // undo is comparable only when all adjacent text is one call
  FakeServices services;
  bool typing = false;

 public:
  const std::string start;
  Editor editor;
  json steps = json::array();
  std::size_t calls = 0;

 private:
  std::size_t Below(std::size_t limit) { return engine() % limit; }
  template <class List>
  auto& Of(const List& list) {
    return list[Below(std::size(list))];
  }

  std::string Character() {
    static const char* const pieces[] = {
        "a",       "B",   " ",    "\t",    "ä",   "😀",   "\n",   "\r\n",   "\"",     "'",
        "\\",      "%s",  "%",    "#{1}",  "#$x", "#@x",  "#",    "{",      "$",      "\\n",
        "__END__", "\"&", "\x7f", "\\x41", "*/",  "</a>", "\x1a", "\u2028", "\ufeff", "\v"};
    return loneReturns && !undoes && Below(15) == 0 ? "\r" : Of(pieces);
  }
  // Characters and, unless they would split a call, bytes from `lowest` on.
  std::string Text(std::size_t pieces, std::size_t lowest = 1, std::size_t highest = 255) {
    std::string text;
    for (; pieces > 0; --pieces) {
      const char byte = static_cast<char>(lowest + Below(highest - lowest + 1));
      text += undoes || byte == '\r' || Below(3) != 0 ? Character() : std::string(1, byte);
    }
    return text;
  }

  void AddStep() {
    static constexpr const char* keys[][2] = {{"Backspace", "backspace"},
                                              {"Delete", "delete_char"},
                                              {"Down", "cursor_down"},
                                              {"End", "line_end"}};
    const std::size_t kind = Below(8);
    if (kind == 0) return Type({{"key", "Enter"}}, "\n");
    if (kind == 1) return Type({{"key", "Tab"}}, "\t");
    if (kind < 4) return CallAny();
    if (kind == 4) {
      const auto& [key, function] = Of(keys);
      return Call({{"key", key}}, function, {});
    }
    // No incomplete character in a long text: the document could complete it between calls.
    const bool isLong = !undoes && Below(12) == 0;
    const std::string text = isLong ? Text(400 + Below(1200), 0x80, 0xBF) : Text(Below(8));
    Type(IsValidUtf8(text) ? json{{"text", text}} : Bytes(text), text);
  }

  void Type(const json& step, const std::string& text) {
    steps.push_back(step);
    if (!typing) editor.BeginStep();
    typing = true;
    if (!text.empty()) editor.Current().Write(text);
  }
  void EndTyping() {
    if (typing) editor.EndStep();
    typing = false;
  }

  void Call(const json& step, const char* function, const std::vector<StepArgument>& arguments) {
    const PassedArguments passed(arguments);
    EndTyping();
    try {
      CallMacroFunction(MacroFunctionId(function), editor, services, passed.List(), encoding);
      steps.push_back(step);
      ++calls;
    } catch (const WrongCall&) {
      steps.push_back({{"call", "line_count"}});
    }
  }

  void CallAny() {
    const MacroFunction& function = Of(MacroFunctions());
    const std::string name = function.name, group = function.group;
    if (group == "Macro" || name == "open_document" || name == "save_document") return;
    if (group == "Undo" && !undoes) return;
    std::vector<StepArgument> arguments;
    json list = json::array();
    for (const MacroParameter& parameter : function.parameters) {
      if (parameter.Optional() && Below(2) == 0) break;
      arguments.push_back(Argument(parameter.kind));
      const auto* const text = std::get_if<std::string>(&arguments.back());
      std::visit([&](const auto& value) { list.push_back(value); }, arguments.back());
      if (text && !IsValidUtf8(*text)) list.back() = Bytes(*text);
      if (!text && Below(3) == 0) list.back() = list.back().get<double>();  // 3.0 is 3
    }
    Call({{"call", name}, {"arguments", list}}, function.name, arguments);
  }

  // Mostly a valid argument.
  StepArgument Argument(ParameterKind kind) {
    static const char* const words[] = {"", "ignore_case", "wrap", "selection", "unique"};
    static const char* const names[] = {"a", "ä", "\\s*", "^", "[^a]+", "\"", "\\\\"};
    static const std::int32_t integers[] = {0, -1, 70, 2000000000, -2147483647 - 1};
    static const double reals[] = {0.5, -2.25, 3e9, 1e15, 0.1, -1234567.875, 1e-7};
    const auto number = static_cast<std::int32_t>(Below(4) + (Below(9) != 0));
    const std::size_t choice = Below(6);
    if (kind == ParameterKind::kWords) return Of(words);
    if (kind == ParameterKind::kName) return choice < 3 ? Of(names) : Text(Below(8));
    if (kind != ParameterKind::kText && kind != ParameterKind::kLineText) {
      if (choice == 0) return std::to_string(number);
      return number;
    }
    if (choice == 0) return Of(integers);
    if (choice == 1) return Of(reals);
    return Text(Below(8));
  }
};

std::string StateOf(Editor& editor) {
  const Range selection = editor.Current().Selection();
  std::string state = testing::PrintToString(editor.clipboard);
  for (std::size_t i = 1; i <= editor.DocumentCount(); ++i)
    state += "\n" + testing::PrintToString(editor.At(i).Bytes());
  for (const std::size_t number : {editor.CurrentNumber(), selection.from.line,
                                   selection.from.offset, selection.to.line, selection.to.offset})
    state += " " + std::to_string(number);
  return state;
}

// The module, the engine and the files of one language.
class Runner {
 public:
  explicit Runner(const std::string& extension)
      : folder(fs::temp_directory_path() / ("recordings-" + std::to_string(GetCurrentProcessId()))),
        options(OptionsFor(folder / ("macro." + extension))),
        language(ChooseLanguage({}, options.macro)),
        module(ProgramFolder() / "scriptruby.dll", &language),
        engines(language.engine),
        composer(TemplatesOf(module, language)) {
    fs::create_directory(folder);
  }
  ~Runner() { fs::remove_all(folder); }

  std::string Compose(const json& steps) {
    std::ofstream(folder / "steps.json", std::ios::binary) << steps.dump();
    return composer.Compose(ReadRecording(folder / "steps.json"));
  }
  ExitCode Run(const std::string& macro, Editor& editor) {
    std::ofstream(options.macro, std::ios::binary) << macro;
    RunContext context = {options, module, language, engines.Running(), reporter, profile};
    return RunMacro(context, editor);
  }

 private:
  static RunOptions OptionsFor(const fs::path& macro) {
    RunOptions options;
    options.macro = macro;
    return options;
  }

  const fs::path folder;
  const RunOptions options;
  const Language language;
  ScriptModule module;
  EngineWatch engines;
  MacroComposer composer;
  Reporter reporter{Reporter::Form::kText};
  CallProfile profile;
};

class RecordingTest : public testing::TestWithParam<const char*> {};

TEST_P(RecordingTest, MacroDoesWhatWasRecorded) {
  const std::string language = GetParam();
  Runner runner(language);
  const unsigned first = Setting("SCRIPTRUBY_TEST_SEED", 0);
  const unsigned count = Setting("SCRIPTRUBY_TEST_RECORDINGS", language == "vbs" ? 250 : 1000);
  std::size_t steps = 0, calls = 0;
  for (unsigned seed = first; seed != first + count && !HasFailure(); ++seed) {
    SCOPED_TRACE("seed " + std::to_string(seed));
    RandomRecording recording(seed, language);
    const std::string macro = runner.Compose(recording.steps);
    SCOPED_TRACE(macro);
    Editor editor{Document(recording.start)};
    EXPECT_EQ(runner.Run(macro, editor), kSuccess);
    EXPECT_EQ(StateOf(editor), StateOf(recording.editor));
    steps += recording.steps.size();
    calls += recording.calls;
  }
  std::printf("figure: %s: %u recordings from seed %u, %zu steps, %zu of them calls\n",
              language.c_str(), count, first, steps, calls);
  EXPECT_GT(calls, count);
}

INSTANTIATE_TEST_SUITE_P(Languages, RecordingTest, testing::Values("rbs", "js", "vbs"),
                         [](const auto& info) { return std::string(info.param); });

}  // namespace
