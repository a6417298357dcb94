// SPDX-License-Identifier: MIT
// The macro functions that a macro calls on `tarn`: one table of names, parameters, results and
// help, from which the lookup, the argument checks and the documentation come. The functions
// themselves stand by groups in functions/.
//
// Lines and columns count from 1, columns in characters (Characters.h). Numbers may arrive as an
// integer, as a real without fraction or as the text of a number (which is how a variable passed by
// reference comes); texts may come from any kind of argument.
//
// A text that cannot pass between macro and host unchanged makes the call fail instead of changing
// the document: the module cuts a text argument at 512 characters and a text result at 1023, and
// widens results by the system's ANSI code page but narrows arguments by dropping high bytes, so
// some bytes (0x80 to 0x9F in Western code pages) would come back as others unless the engine undoes
// the widening. What cannot be seen from here is a character above U+00FF in an argument: the module
// has already narrowed it. These limits are for what passes; inside the editor texts have none.
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

// A call that breaks a function's rules; the documents are unchanged. The text names the function.
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

// An integer, or a text for functions that answer one.
using MacroResult = std::variant<std::int32_t, std::string>;

enum class ParameterKind {
  kLine,       // an existing line
  kLineOrEnd,  // an existing line, or the one after the last
  kLastLine,   // an existing line, not before the one of the parameter before
  kColumn,     // a column of the line of the parameter before, or the one behind its last
  kCount,      // 0 or more
  kDocument,   // the number of a document
  kText,
  kLineText,  // a text without line ends
  kName,      // a text that is not empty
  kWords,     // options: some of the words of the parameter, with blanks between
  kTexts,     // any number of texts; the last parameter
};

struct MacroParameter {
  const char* name;
  ParameterKind kind;
  // For the user: what holds when it is left out, as all behind it are then. Null: it must be given.
  const char* otherwise = nullptr;
  std::vector<std::string_view> words = {};  // of kWords: those that there are

  bool Optional() const { return otherwise != nullptr; }
};

enum class ResultKind { kNone, kNumber, kText };

class MacroCall;

struct MacroFunction {
  const char* name;
  std::vector<MacroParameter> parameters;
  ResultKind result;
  const char* help;  // one line that can be understood alone; what it answers comes last
  MacroResult (*run)(MacroCall& call);
  const char* group = "";  // filled in by the table
};

// All functions, group by group. Function n has the number n + 1.
std::span<const MacroFunction> MacroFunctions();

// The number of a function, in any case (some script languages know none); kUnknownId if there is
// none. Never 0, which engines call for an object's default value.
std::uint32_t MacroFunctionId(std::string_view name);
// What to say of such a name; with the function that may have been meant.
std::string NoMacroFunction(std::string_view name);

// How a script engine shows its macros a text result, which it gets in UTF-16 by the system's ANSI
// code page.
enum class ResultEncoding {
  kCharacters,  // as that UTF-16
  kBytes,       // as the bytes that the host gave
};

// Carries out function `id` as one step of the editor. Throws WrongCall.
MacroResult CallMacroFunction(std::uint32_t id, Editor& editor, EditorServices& services,
                              std::span<const HostArgument> arguments, ResultEncoding encoding);

// "(line, column[, count])"
std::string ParameterList(const MacroFunction& function);
// "ignore_case, whole_word"
std::string WordList(const MacroParameter& parameter);
