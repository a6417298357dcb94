// SPDX-License-Identifier: MIT
// The macro functions that a macro calls on `tarn`: one table of names, parameters and help, from
// which the lookup, the argument checks and the help text come.
//
// Numbers may arrive as an integer, as a real without fraction or as the text of a number (which is
// how a variable passed by reference comes); texts may come from any kind of argument.
//
// A text that cannot pass between macro and host unchanged makes the call fail instead of changing
// the document: the module cuts a text argument at 512 characters and a text result at 1023, and
// widens results by the system's ANSI code page but narrows arguments by dropping high bytes, so
// some bytes (0x80 to 0x9F in Western code pages) would come back as others unless the engine undoes
// the widening. What cannot be seen from here is a character above U+00FF in an argument: the module
// has already narrowed it.
#pragma once

#include <cstdint>
#include <span>
#include <stdexcept>
#include <string>
#include <string_view>
#include <variant>

#include "Document.h"
#include "HostLink.h"

// A call that breaks a function's rules; the document is unchanged. The text names the function.
struct WrongCall : std::runtime_error {
  using std::runtime_error::runtime_error;
};

// An integer, or a text for functions that answer one.
using MacroResult = std::variant<std::int32_t, std::string>;

// The number of a function, in any case (some script languages know none); kUnknownId if there is
// none. Never 0, which engines call for an object's default value.
std::uint32_t MacroFunctionId(std::string_view name);

// How a script engine shows its macros a text result, which it gets in UTF-16 by the system's ANSI
// code page.
enum class TextPassage {
  kCharacters,  // as that UTF-16
  kBytes,       // as the bytes that the host gave
};

// Carries out function `id`. Throws WrongCall. `message` writes to standard error.
MacroResult CallMacroFunction(std::uint32_t id, Document& document,
                              std::span<const HostArgument> arguments, TextPassage passage);

// One line for each function.
std::string MacroFunctionHelp();
