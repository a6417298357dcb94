// SPDX-License-Identifier: MIT
// The macro functions that a macro calls on `tarn`: one table of names, parameters, results and
// help. Lookup, argument checks and documentation use it. functions/groups has the functions.
//
// Lines and columns count from 1, columns in characters (Characters.h). A number is an integer, a
// real without fraction, or the text of a number (the form of a variable passed by reference). Any
// argument can be a text.
//
// A call fails when the module would change a text on its way, so that no document is damaged. The
// module cuts long texts (Limits.h). It widens results by the
// system's ANSI code page but narrows arguments by dropping high bytes, so some bytes (0x80 to 0x9F
// in Western code pages) come back changed unless the engine undoes the widening. A character above
// U+00FF in an argument cannot be detected here, because the module has already narrowed it.
#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <stdexcept>
#include <string>
#include <string_view>
#include <variant>
#include <vector>

#include "document/Editor.h"
#include "functions/EditorServices.h"
#include "functions/HostArgument.h"

// A call that breaks a function's rules. The documents are unchanged. The text names the function.
struct WrongCall : std::runtime_error {
  WrongCall(std::string functionName, std::size_t argumentIndex, std::string expectation,
            const std::string& text)
      : std::runtime_error(text),
        function(std::move(functionName)),
        argument(argumentIndex),
        expected(std::move(expectation)) {}

  std::string function;
  std::size_t argument;  // from 1; 0: not about one argument
  std::string expected;
};

// A text for functions that return one; otherwise an integer.
using MacroResult = std::variant<std::int32_t, std::string>;

enum class ParameterKind {
  kLine,       // an existing line
  kLineOrEnd,  // an existing line, or the one after the last
  kLastLine,   // an existing line, not before the one of the parameter before
  kColumn,     // a column of the line of the parameter before, or the one after its last
  kCount,      // 0 or more
  kDocument,   // the number of a document
  kText,
  kLineText,  // a text without line ends
  kName,      // a text that is not empty
  kWords,     // options: words of the parameter, separated by spaces
  kTexts,     // any number of texts; the last parameter
};

struct MacroParameter {
  const char* name;
  ParameterKind kind;
  // The default value, for the user; a parameter without one (null) is required. Only the last
  // arguments of a call can be omitted.
  const char* defaultValue = nullptr;
  std::vector<std::string_view> words = {};  // the words that kWords allows

  bool Optional() const { return defaultValue != nullptr; }
};

enum class ResultKind { kNone, kNumber, kText };

class MacroCall;

struct MacroFunction {
  const char* name;
  std::vector<MacroParameter> parameters;
  ResultKind result;
  const char* help;  // one line; names the result last
  MacroResult (*run)(MacroCall& call);
  const char* group = "";  // filled in by the table
};

// All functions, by group. The id of a function is its index + 1.
std::span<const MacroFunction> MacroFunctions();

// The id of a function, or kUnknownId. Ignores case, as some script languages do. Never 0, which is
// an object's default value in Active Scripting.
std::uint32_t MacroFunctionId(std::string_view name);
// The message for an unknown name, with a suggestion if one is similar.
std::string NoMacroFunction(std::string_view name);

// How a script engine passes a text result, which it gets as UTF-16 by the ANSI code page, to a
// macro.
enum class ResultEncoding {
  kCharacters,  // as UTF-16
  kBytes,       // as the bytes of the host
};

// Calls function `id` as one undo step. Throws WrongCall.
MacroResult CallMacroFunction(std::uint32_t id, Editor& editor, EditorServices& services,
                              std::span<const HostArgument> arguments, ResultEncoding encoding);

// "(line, column[, count])"
std::string ParameterList(const MacroFunction& function);
// "ignore_case, whole_word"
std::string WordList(const MacroParameter& parameter);
