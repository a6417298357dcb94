// SPDX-License-Identifier: MIT
#include "functions/MacroFunctions.h"

#include <algorithm>
#include <cctype>
#include <cstring>
#include <iterator>
#include <numeric>

#include "functions/Limits.h"
#include "functions/MacroCall.h"
#include "functions/groups/FunctionGroups.h"
#include "platform/Encoding.h"

namespace {

std::vector<MacroFunction> AllFunctions() {
  std::vector<MacroFunction> all;
  for (const FunctionGroup& group :
       {TextGroup(), LineGroup(), CursorGroup(), SelectionGroup(), DeletingGroup(), FindGroup(),
        CaseGroup(), MarkGroup(), ClipboardGroup(), UndoGroup(), DocumentGroup(), MacroGroup()})
    for (MacroFunction function : group.functions) {
      function.group = group.name;
      all.push_back(std::move(function));
    }
  return all;
}

// Why a macro would not receive this text unchanged; empty when it would.
std::string WhyRejected(const std::string& text, ResultEncoding encoding) {
  const std::size_t length = WideLength(text);
  if (length > kLongestResult)
    return std::to_string(length) + " characters, but a result holds at most " +
           std::to_string(kLongestResult) + "; read it in pieces with get_text";
  if (text.find('\0') != text.npos) return "a zero byte, which ends a text result";
  if (encoding == ResultEncoding::kBytes || LowBytesStay(text)) return {};
  return "a byte from 0x80 to 0x9F, which the system's code page changes on its way to the macro "
         "(capital umlauts and dashes in UTF-8 have such a byte); use Ruby";
}

// The Levenshtein distance, ignoring case. `to` is in lower case.
std::size_t EditDistance(std::string_view from, std::string_view to) {
  std::vector<std::size_t> row(to.size() + 1);  // distances to each prefix of `to`
  std::iota(row.begin(), row.end(), std::size_t{0});
  for (const char ch : from) {
    const int small = std::tolower(static_cast<unsigned char>(ch));
    std::size_t diagonal = row[0]++;
    for (std::size_t i = 0; i < to.size(); ++i) {
      const std::size_t replaced = diagonal + (small != to[i]);
      diagonal = row[i + 1];
      row[i + 1] = std::min({replaced, diagonal + 1, row[i] + 1});
    }
  }
  return row.back();
}

void CheckResult(const MacroFunction& function, const MacroCall& call, const MacroResult& result,
                 ResultEncoding encoding) {
  const std::string* text = std::get_if<std::string>(&result);
  const std::string reason = text ? WhyRejected(*text, encoding) : "";
  if (reason.empty()) return;
  const bool line = call.Has(0) && function.parameters.front().kind == ParameterKind::kLine;
  const std::string what = line ? "line " + std::to_string(call.Number(0)) : "the text";
  throw WrongCall(function.name, 0, "a text that a result can hold",
                  std::string(function.name) + ": " + what + " has " + reason);
}

}  // namespace

std::span<const MacroFunction> MacroFunctions() {
  static const std::vector<MacroFunction> functions = AllFunctions();
  return functions;
}

std::uint32_t MacroFunctionId(std::string_view name) {
  std::uint32_t id = 0;
  for (const MacroFunction& function : MacroFunctions()) {
    ++id;
    if (name.size() == std::strlen(function.name) &&
        _strnicmp(name.data(), function.name, name.size()) == 0)
      return id;
  }
  return kUnknownId;
}

std::string NoMacroFunction(std::string_view name) {
  const auto distance = [name](const MacroFunction& each) { return EditDistance(name, each.name); };
  const MacroFunction& nearest = *std::ranges::min_element(MacroFunctions(), {}, distance);
  const bool alike = distance(nearest) <= std::max<std::size_t>(1, name.size() / 4);
  return "unknown macro function " + std::string(name) +
         (alike ? "; did you mean " + std::string(nearest.name) + "?" : "") + " (see --functions)";
}

MacroResult CallMacroFunction(std::uint32_t id, Editor& editor, EditorServices& services,
                              std::span<const HostArgument> arguments, ResultEncoding encoding) {
  const std::span<const MacroFunction> functions = MacroFunctions();
  if (id < 1 || id > functions.size())
    throw WrongCall("", 0, "a macro function",
                    "unknown macro function number " + std::to_string(id));
  const MacroFunction& function = functions[id - 1];
  MacroCall call(function, editor, services, arguments);
  const EditorStep step(editor);
  MacroResult result = function.run(call);
  CheckResult(function, call, result, encoding);
  return result;
}

std::string ParameterList(const MacroFunction& function) {
  std::string list, brackets;
  for (const MacroParameter& parameter : function.parameters) {
    const bool texts = parameter.kind == ParameterKind::kTexts;
    if (parameter.Optional()) brackets += "]";
    list += (parameter.Optional() ? "[" : "") + std::string(list.empty() ? "" : ", ") +
            parameter.name + (texts ? "..." : "");
  }
  return "(" + list + brackets + ")";
}

std::string WordList(const MacroParameter& parameter) {
  std::string list;
  for (const std::string_view word : parameter.words)
    list += (list.empty() ? "" : ", ") + std::string(word);
  return list;
}
