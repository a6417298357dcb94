// SPDX-License-Identifier: MIT
#include "functions/FunctionReference.h"

#include <algorithm>
#include <cstdio>
#include <string_view>

#include "functions/Limits.h"
#include "functions/MacroFunctions.h"

namespace {

constexpr char kMarkdownHead[] = R"(# Macro functions

Call these functions on `tarn`, in Ruby on `@tarn`:

```ruby
@tarn.set_line(1, @tarn.get_line(1).upcase)
```

- Lines and columns count from 1. Columns count characters; a line end is one character.
- The last position of a text is the start of the line after its last one.
- A number may be given as a text, and a text as a number.
- A call with other arguments than these is a wrong call. It changes nothing and ends the macro.
- A text result holds at most %zu characters, a text argument at most %zu bytes. A longer argument
  is refused, because the module may have cut it.

`macrorun --functions=markdown` prints this page, `macrorun --functions` one line for each function.
)";

constexpr char kStubsHead[] =
    R"(# The functions of Tarn for language servers, written by macrorun --stubs. Macros do not load
# this file: they get @tarn from the editor.

# The class of @tarn.
class Tarn
)";

constexpr char kStubsTail[] = R"(end

# @type [Tarn]
@tarn ||= Tarn.new
)";

// A kind of parameter in the page and in the stubs.
struct KindText {
  const char* kind;
  const char* ruby;  // type
  const char* accepted;
};

KindText TextOf(ParameterKind kind) {
  switch (kind) {
    case ParameterKind::kLine:
      return {"number", "Integer", "an existing line"};
    case ParameterKind::kLineOrEnd:
      return {"number", "Integer", "an existing line, or the one after the last"};
    case ParameterKind::kLastLine:
      return {"number", "Integer", "an existing line, not before the first"};
    case ParameterKind::kColumn:
      return {"number", "Integer", "a column of that line, or the one after its last"};
    case ParameterKind::kCount:
      return {"number", "Integer", "0 or more"};
    case ParameterKind::kDocument:
      return {"number", "Integer", "the number of a document"};
    case ParameterKind::kText:
      return {"text", "String", "any text"};
    case ParameterKind::kLineText:
      return {"text", "String", "a text without a line end"};
    case ParameterKind::kName:
      return {"text", "String", "a text that is not empty"};
    case ParameterKind::kWords:
      return {"text", "String", "words with spaces between"};
    case ParameterKind::kTexts:
      break;
  }
  return {"texts", "Array<String>", "any number of texts"};
}

std::string Accepted(const MacroParameter& parameter) {
  const std::string words = WordList(parameter);
  return TextOf(parameter.kind).accepted + (words.empty() ? "" : ", from: " + words);
}

std::string Sentence(std::string text) {
  if (text.front() >= 'a' && text.front() <= 'z') text.front() -= 'a' - 'A';
  return text + ".";
}

std::string_view ResultName(ResultKind kind) {
  if (kind == ResultKind::kNone) return "nothing";
  return kind == ResultKind::kNumber ? "a number" : "a text";
}

std::string_view RubyType(ResultKind kind) {
  if (kind == ResultKind::kNone) return "void";
  return kind == ResultKind::kNumber ? "Integer" : "String";
}

// `begin(group)` comes before the first function of each group.
template <class Begin, class Each>
void ForEachFunction(const Begin& begin, const Each& each) {
  std::string_view group;
  for (const MacroFunction& function : MacroFunctions()) {
    if (group != function.group) begin(group = function.group);
    each(function);
  }
}

// " (options: unique)"
std::string Options(const MacroFunction& function) {
  if (function.parameters.empty()) return {};
  const std::string words = WordList(function.parameters.back());
  return words.empty() ? words : " (options: " + words + ")";
}

std::string ParameterTable(const MacroFunction& function) {
  if (function.parameters.empty()) return {};
  std::string table = "\n| Parameter | Type | Accepted | Default |\n|---|---|---|---|\n";
  for (const MacroParameter& parameter : function.parameters) {
    table += std::string("| `") + parameter.name + "` | " + TextOf(parameter.kind).kind + " | " +
             Accepted(parameter) + " | " + (parameter.Optional() ? parameter.defaultValue : "") +
             " |\n";
  }
  return table;
}

std::string MarkdownOf(const MacroFunction& function) {
  return std::string("\n### ") + function.name + "\n\n`" + function.name + ParameterList(function) +
         "`\n\n" + Sentence(function.help) + "\n" + ParameterTable(function) +
         "\nResult: " + std::string(ResultName(function.result)) + ".\n";
}

// "(line, count = nil)": the engine does not pass nil to the editor, so nil means the default.
std::string RubyParameters(const MacroFunction& function) {
  std::string list;
  for (const MacroParameter& parameter : function.parameters) {
    list += list.empty() ? "" : ", ";
    if (parameter.kind == ParameterKind::kTexts) list += "*";
    list += parameter.name;
    if (parameter.Optional()) list += " = nil";
  }
  return list.empty() ? list : "(" + list + ")";
}

std::string ParameterTag(const MacroParameter& parameter) {
  std::string type = TextOf(parameter.kind).ruby;
  if (parameter.Optional()) type += ", nil";
  std::string tag =
      std::string("  # @param ") + parameter.name + " [" + type + "] " + Accepted(parameter);
  if (parameter.Optional()) tag += std::string("; default: ") + parameter.defaultValue;
  return tag + "\n";
}

std::string StubOf(const MacroFunction& function) {
  std::string stub = "\n  # " + Sentence(function.help) + "\n  #\n";
  for (const MacroParameter& parameter : function.parameters) stub += ParameterTag(parameter);
  stub += "  # @return [" + std::string(RubyType(function.result)) + "]\n";
  return stub + "  def " + function.name + RubyParameters(function) + "; end\n";
}

}  // namespace

std::string FunctionList() {
  std::string list;
  ForEachFunction([&](std::string_view group) { list += std::string(group) + ":\n"; },
                  [&](const MacroFunction& function) {
                    std::string call = "  " + (function.name + ParameterList(function));
                    call.resize(std::max<std::size_t>(call.size() + 1, 32), ' ');
                    list += call + function.help + Options(function) + "\n";
                  });
  return list;
}

std::string FunctionMarkdown() {
  char head[sizeof kMarkdownHead + 16];
  std::snprintf(head, sizeof head, kMarkdownHead, kLongestResult, kLongestArgument);
  std::string page = head;
  ForEachFunction([&](std::string_view group) { page += "\n## " + std::string(group) + "\n"; },
                  [&](const MacroFunction& function) { page += MarkdownOf(function); });
  return page;
}

std::string FunctionStubs() {
  std::string file = kStubsHead;
  ForEachFunction(
      [&](std::string_view group) { file += "\n  # @!group " + std::string(group) + "\n"; },
      [&](const MacroFunction& function) { file += StubOf(function); });
  return file + kStubsTail;
}
