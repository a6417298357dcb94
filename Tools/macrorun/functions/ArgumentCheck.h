// SPDX-License-Identifier: MIT
// The arguments of one call of a macro function, checked against its parameters before it runs.
//
// Arguments are indexed from 0 in the order of the parameters.
#pragma once

#include <cstddef>
#include <set>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "functions/MacroFunctions.h"

class ArgumentCheck {
 public:
  // Throws WrongCall for arguments that the editor's current document does not allow; without an
  // editor, for those that no document allows.
  ArgumentCheck(const MacroFunction& function, std::span<const HostArgument> arguments,
                const Editor* editor);

  bool Has(std::size_t index) const { return index < values.size(); }
  std::size_t Number(std::size_t index) const { return values[index].number; }
  std::size_t Number(std::size_t index, std::size_t otherwise) const {
    return Has(index) ? values[index].number : otherwise;
  }
  // Empty when the argument is missing.
  const std::string& Text(std::size_t index) const {
    static const std::string none;
    return Has(index) ? values[index].text : none;
  }
  // The words of an optional argument.
  std::set<std::string_view> Words(std::size_t index) const;

  // Throws WrongCall with the given argument. Call it only before a change.
  [[noreturn]] void Fail(std::size_t index, const std::string& expected) const;
  [[noreturn]] void Fail(const std::string& expected) const;

 private:
  struct Value {
    std::size_t number = 0;
    std::string text;
  };
  void CheckCount(std::size_t given) const;
  Value Check(std::size_t index, ParameterKind kind) const;
  std::size_t CheckNumber(std::size_t index, std::size_t first, std::size_t last,
                          const std::string& what) const;
  std::string CheckText(std::size_t index, ParameterKind kind) const;
  std::size_t Length(std::size_t line) const;

  const MacroFunction& function;
  const std::span<const HostArgument> arguments;
  const Editor* const editor;
  std::vector<Value> values;
};
