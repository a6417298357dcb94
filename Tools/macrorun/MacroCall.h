// SPDX-License-Identifier: MIT
// One call of a macro function: its checked arguments, and what the function works on.
//
// Arguments are by index from 0, in the order of the function's parameters. Those that the caller
// may ask for are given or optional; the checks are made before the function runs.
#pragma once

#include <cstddef>
#include <initializer_list>
#include <set>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "MacroFunctions.h"

class MacroCall {
 public:
  // Checks the arguments. Throws WrongCall.
  MacroCall(const MacroFunction& function, Editor& editor, EditorServices& services,
            std::span<const HostArgument> arguments);

  Editor& editor;
  EditorServices& services;
  Document& document() { return editor.Current(); }

  bool Has(std::size_t index) const { return index < values.size(); }
  std::size_t Number(std::size_t index) const { return values[index].number; }
  std::size_t Number(std::size_t index, std::size_t otherwise) const {
    return Has(index) ? values[index].number : otherwise;
  }
  std::string Text(std::size_t index) const { return Has(index) ? values[index].text : ""; }
  // Of the arguments line and column.
  Position At(std::size_t lineIndex) const;
  // The line of an optional argument, by default the cursor's, which must be an existing one.
  std::size_t LineOrCursor(std::size_t index);
  // The words of an optional argument, each of which must be among those allowed.
  std::set<std::string_view> Words(std::size_t index,
                                   std::initializer_list<std::string_view> allowed);

  // Throws WrongCall, with the argument as it was given. Only before a change.
  [[noreturn]] void Fail(std::size_t index, const std::string& expected) const;
  [[noreturn]] void Fail(const std::string& expected) const;

 private:
  struct Value {
    std::size_t number = 0;
    std::string text;
  };
  void CheckCount(std::size_t given) const;
  Value Check(std::size_t index, ParameterKind kind);
  std::size_t CheckNumber(std::size_t index, std::size_t first, std::size_t last,
                          const std::string& what) const;
  std::string CheckText(std::size_t index, ParameterKind kind) const;

  const MacroFunction& function;
  const std::span<const HostArgument> arguments;
  std::vector<Value> values;
};
