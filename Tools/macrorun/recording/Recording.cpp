// SPDX-License-Identifier: MIT
#include "recording/Recording.h"

#include <cmath>
#include <limits>
#include <nlohmann/json.hpp>

#include "functions/ArgumentCheck.h"
#include "platform/Encoding.h"
#include "platform/ExitCode.h"
#include "platform/Files.h"

using nlohmann::json;

namespace {

// A key writes a text, or calls a macro function without arguments.
constexpr struct {
  const char* name;
  const char* text;
  const char* function;
} kKeys[] = {
    {"Enter", "\n", nullptr},
    {"Tab", "\t", nullptr},
    {"Backspace", nullptr, "backspace"},
    {"Delete", nullptr, "delete_char"},
    {"Left", nullptr, "cursor_left"},
    {"Right", nullptr, "cursor_right"},
    {"Up", nullptr, "cursor_up"},
    {"Down", nullptr, "cursor_down"},
    {"Home", nullptr, "line_start"},
    {"End", nullptr, "line_end"},
    {"Ctrl+Left", nullptr, "word_left"},
    {"Ctrl+Right", nullptr, "word_right"},
    {"Ctrl+Home", nullptr, "document_start"},
    {"Ctrl+End", nullptr, "document_end"},
    {"Ctrl+Delete", nullptr, "delete_word"},
};

const MacroFunction* FunctionNamed(const std::string& name) {
  const std::uint32_t id = MacroFunctionId(name);
  return id == kUnknownId ? nullptr : &MacroFunctions()[id - 1];
}

// As JSON, shortened for a message.
std::string Shown(const json& value) {
  std::string text = value.dump(-1, ' ', true);
  if (text.size() > 40) text = text.substr(0, 40) + "...";
  return text;
}

StepArgument Number(double value) {
  using Limits = std::numeric_limits<std::int32_t>;
  if (std::trunc(value) == value && value >= Limits::min() && value <= Limits::max())
    return static_cast<std::int32_t>(value);
  return value;
}

class StepReader {
 public:
  StepReader(std::string stepPlace, const json& stepValue)
      : place(std::move(stepPlace)), step(stepValue) {}

  RecordedStep Read() const;

 private:
  [[noreturn]] void Fail(const std::string& key, const std::string& text) const {
    throw UsageError(place + ": " + (key.empty() ? "" : "\"" + key + "\": ") + text);
  }
  std::string Kind() const;
  std::string String(const std::string& key, const char* expected) const;
  void CheckText(const std::string& key, const std::string& text) const;
  std::string Bytes(const std::string& key, const json& list) const;
  RecordedStep Typed(std::string text) const {
    return {place, RecordedStep::Kind::kText, std::move(text)};
  }
  RecordedStep Key() const;
  RecordedStep Call() const;
  StepArgument Argument(std::size_t number, const json& value) const;

  const std::string place;
  const json& step;
};

RecordedStep StepReader::Read() const {
  const std::string kind = Kind();
  if (kind == "key") return Key();
  if (kind == "call") return Call();
  if (kind == "bytes") return Typed(Bytes("bytes", step["bytes"]));
  const std::string text = String("text", "a text");
  CheckText("text", text);
  return Typed(text);
}

// The key that determines the kind of step.
std::string StepReader::Kind() const {
  constexpr char kExpected[] = "expected an object with \"text\", \"bytes\", \"key\" or \"call\"";
  if (!step.is_object()) Fail("", std::string(kExpected) + ", got " + Shown(step));
  std::string kind;
  for (const auto& [key, value] : step.items()) {
    if (key == "arguments") continue;
    if (key != "text" && key != "bytes" && key != "key" && key != "call")
      Fail(key, step.contains("call") ? "unknown key; a call has \"call\" and \"arguments\""
                                      : std::string("unknown key; ") + kExpected);
    if (!kind.empty()) Fail(key, "cannot be combined with \"" + kind + "\"");
    kind = key;
  }
  if (kind.empty()) Fail("", kExpected);
  if (kind != "call" && step.contains("arguments")) Fail("arguments", "needs \"call\"");
  return kind;
}

std::string StepReader::String(const std::string& key, const char* expected) const {
  const json& value = step[key];
  if (!value.is_string()) Fail(key, std::string("expected ") + expected + ", got " + Shown(value));
  return value.get<std::string>();
}

void StepReader::CheckText(const std::string& key, const std::string& text) const {
  if (text.find('\0') != text.npos) Fail(key, "a zero byte cannot pass to a macro function");
}

std::string StepReader::Bytes(const std::string& key, const json& list) const {
  if (!list.is_array()) Fail(key, "expected a list of bytes, got " + Shown(list));
  std::string bytes;
  for (const json& value : list) {
    const bool fits = value.is_number_unsigned() && value.get<std::uint64_t>() <= 255;
    if (!fits)
      Fail(key, "byte " + std::to_string(bytes.size() + 1) +
                    ": expected a number from 1 to 255, got " + Shown(value));
    bytes += static_cast<char>(value.get<unsigned>());
  }
  CheckText(key, bytes);
  return bytes;
}

RecordedStep StepReader::Key() const {
  const std::string name = String("key", "the name of a key");
  std::string known;
  for (const auto& key : kKeys) {
    known += (known.empty() ? "" : ", ") + std::string(key.name);
    if (name != key.name) continue;
    if (key.function) return {place, RecordedStep::Kind::kCall, {}, FunctionNamed(key.function)};
    RecordedStep typed = Typed(key.text);
    if (name == "Enter") typed.kind = RecordedStep::Kind::kEnter;
    return typed;
  }
  Fail("key", "expected one of " + known + ", got " + Shown(name));
}

RecordedStep StepReader::Call() const {
  const std::string name = String("call", "the name of a macro function");
  const MacroFunction* function = FunctionNamed(name);
  if (!function) Fail("call", NoMacroFunction(name));
  RecordedStep call = {place, RecordedStep::Kind::kCall, {}, function};
  const json arguments = step.value("arguments", json::array());
  if (!arguments.is_array()) Fail("arguments", "expected a list, got " + Shown(arguments));
  for (const json& value : arguments)
    call.arguments.push_back(Argument(call.arguments.size() + 1, value));
  try {
    const PassedArguments passed(call.arguments);
    const ArgumentCheck check(*function, passed.List(), nullptr);
  } catch (const WrongCall& wrong) {
    Fail("arguments", wrong.what());
  }
  return call;
}

StepArgument StepReader::Argument(std::size_t number, const json& value) const {
  if (value.is_number()) return Number(value.get<double>());
  std::string text;
  if (value.is_string()) {
    text = value.get<std::string>();
    CheckText("arguments", text);
  } else if (value.is_object() && value.size() == 1 && value.contains("bytes")) {
    text = Bytes("arguments", value["bytes"]);
  } else {
    Fail("arguments", "argument " + std::to_string(number) +
                          ": expected a number, a text or an object with \"bytes\", got " +
                          Shown(value));
  }
  return text;
}

json ReadJson(const std::filesystem::path& file) try {
  return json::parse(ReadInput(file));
} catch (const json::exception& error) {
  const std::string text = error.what();
  throw UsageError(ToUtf8(file) + ": " + text.substr(text.find("] ") + 2));
}

}  // namespace

std::vector<RecordedStep> ReadRecording(const std::filesystem::path& file) {
  const json list = ReadJson(file);
  const std::string name = ToUtf8(file);
  if (!list.is_array()) throw UsageError(name + ": expected a list of steps, got " + Shown(list));
  std::vector<RecordedStep> steps;
  for (const json& step : list) {
    const std::string place = name + ": step " + std::to_string(steps.size() + 1);
    steps.push_back(StepReader(place, step).Read());
  }
  return steps;
}

PassedArguments::PassedArguments(const std::vector<StepArgument>& arguments) {
  texts.reserve(arguments.size());  // the list points into it
  for (const StepArgument& argument : arguments) {
    HostArgument passed = {0, "", 0, kTextArgument};
    if (const auto* text = std::get_if<std::string>(&argument)) {
      texts.push_back(*text);
    } else if (const auto* integer = std::get_if<std::int32_t>(&argument)) {
      passed = {static_cast<double>(*integer), "", *integer, kIntegerArgument};
      texts.push_back(std::to_string(*integer));
    } else {
      passed = {std::get<double>(argument), "", 0, kRealArgument};
      texts.push_back(std::to_string(passed.real));
    }
    passed.text = texts.back().c_str();
    list.push_back(passed);
  }
}
