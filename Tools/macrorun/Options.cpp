// SPDX-License-Identifier: MIT
#include "Options.h"

#include <windows.h>
// shellapi.h needs windows.h before it.
#include <shellapi.h>

#include <CLI/CLI.hpp>
#include <string>
#include <vector>

#include "Encoding.h"
#include "ExitCode.h"
#include "MacroFunctions.h"

namespace {

std::string Footer() {
  return "Macros call these functions on the object tarn. Lines count from 1; goto_line and\n"
         "insert_line also take the number after the last line.\n" +
         MacroFunctionHelp() +
         "A line feed in the text of write begins a new line. Texts: at most 511 characters\n"
         "in, 1023 out. Ruby's pass as bytes; of other languages, characters above U+00FF do\n"
         "not pass. A real arrives with six decimals: convert it first. No dialogs: use\n"
         "message. What a function refuses ends the macro.\n"
         "A macro's source is read byte by byte, so UTF-8 in its texts is written as it\n"
         "stands.\n"
         "\n"
         "Exit codes: 0 success, 1 the macro failed, 2 wrong usage or\n"
         "a file that cannot be read or written, 3 stopped by Ctrl+C\n"
         "(a macro that calls nothing: by a second one), 4 fault.\n"
         "Standard output is the document, and only after success.";
}

// In the order that CLI::App::parse wants: the last argument first, without the program.
std::vector<std::string> ReversedArguments() {
  std::vector<std::string> arguments;
  int count = 0;
  wchar_t** wide = CommandLineToArgvW(GetCommandLineW(), &count);
  if (!wide) return arguments;
  for (int i = count - 1; i > 0; --i) arguments.push_back(WideToUtf8(wide[i]));
  LocalFree(wide);
  return arguments;
}

}  // namespace

std::filesystem::path ProgramFolder() {
  std::wstring file(32768, L'\0');
  const DWORD length = static_cast<DWORD>(file.size());
  file.resize(GetModuleFileNameW(nullptr, file.data(), length));
  return std::filesystem::path(file).parent_path();
}

std::optional<int> ParseOptions(Options& options) {
  std::string macro, input, description;
  std::string module = ToUtf8(ProgramFolder() / "scriptruby.dll");
  CLI::App app("Runs a macro over a text and prints the text.", "macrorun");
  app.allow_windows_style_options(false);  // "/x/y" is a path
  app.footer(Footer());
  app.add_option("MACRO", macro, "Macro file");
  app.add_option("FILE", input, "Text to start with; - is standard input, none an empty text");
  app.add_option("--module", module, "Scripting module (default: scriptruby.dll beside macrorun)");
  app.add_option("--description", description,
                 "Language description (default: languages\\EXTENSION.qwsh; none for .rbs)");
  app.add_flag("--trace", options.trace, "Show the module's debug lines");
  app.add_flag("--version", options.version, "Show the versions of macrorun and of the module");
  try {
    app.parse(ReversedArguments());
    if (macro.empty() && !options.version) throw CLI::RequiredError("MACRO");
  } catch (const CLI::ParseError& error) {
    return app.exit(error) == 0 ? kSuccess : kWrongUsage;
  }
  options.macro = PathFromUtf8(macro);
  options.input = PathFromUtf8(input);
  options.module = PathFromUtf8(module);
  options.description = PathFromUtf8(description);
  return std::nullopt;
}
