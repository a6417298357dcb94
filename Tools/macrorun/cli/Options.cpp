// SPDX-License-Identifier: MIT
#include "cli/Options.h"

#include <windows.h>
// shellapi.h needs windows.h before it.
#include <shellapi.h>

#include <CLI/CLI.hpp>
#include <cstdio>
#include <memory>

#include "platform/Encoding.h"
#include "platform/ExitCode.h"
#include "platform/Files.h"
#include "platform/ProgramFile.h"

namespace {

constexpr char kUsage[] =
    "usage: macrorun [OPTION...] MACRO [FILE|-]\n"
    "       macrorun [OPTION...] MACRO --each FILE...\n"
    "       macrorun [OPTION...] --test DIR|MACRO [--promote]\n"
    "       macrorun --check MACRO...\n"
    "       macrorun --record STEPS [-o MACRO]\n";

constexpr char kFooter[] =
    "Exit codes: 0 success, 1 the macro failed, 2 wrong usage or a file that cannot\n"
    "be read or written, 3 stopped or timed out, 4 fault. The text is written only\n"
    "after success. More in Docs/macrorun.md.";

// Omits the positionals, which are in the usage.
class HelpFormatter : public CLI::Formatter {
 public:
  std::string make_usage(const CLI::App*, std::string) const override {
    return kUsage + std::string("\n");
  }
  // Without the default value of a flag.
  std::string make_option_name(const CLI::Option* option, bool positional) const override {
    const std::string name = CLI::Formatter::make_option_name(option, positional);
    return name.substr(0, name.find('{'));
  }
  std::string make_positionals(const CLI::App*) const override { return {}; }
  std::string make_option_opts(const CLI::Option* option) const override {
    return option->get_type_size() == 0 ? "" : " " + option->get_type_name();
  }
  std::string make_group(std::string group, bool positional,
                         std::vector<const CLI::Option*> options) const override {
    std::string text = CLI::Formatter::make_group(group, positional, options);
    return text.substr(text.front() == '\n' ? 1 : 0);
  }
};

// Option values as text, before Convert.
struct Texts {
  std::string macro, input, output, description, module, log, test, record, errors = "text";
  std::vector<std::string> each, check, arguments;
};

// Replaces the library's range check, which accepts NaN and reports the range for text that is no
// number.
template <class Number>
CLI::Validator Between(Number least, Number most, const std::string& expected) {
  const auto check = [=](const std::string& text) -> std::string {
    Number number{};
    if (CLI::detail::lexical_cast(text, number) && number >= least && number <= most) return {};
    return "expected " + expected + ", got \"" + text + "\"";
  };
  return CLI::Validator(check, "");
}

// Refuses an empty path, for example from an unset shell variable.
const CLI::Validator kNotEmpty(
    [](const std::string& text) {
      return std::string(text.empty() ? "expected a file name, got an empty text" : "");
    },
    "");

// In the order of CLI::App::parse: the last argument first, without the program.
std::vector<std::string> ReversedArguments() {
  std::vector<std::string> arguments;
  int count = 0;
  wchar_t** wide = CommandLineToArgvW(GetCommandLineW(), &count);
  if (!wide) return arguments;
  for (int i = count - 1; i > 0; --i) arguments.push_back(WideToUtf8(wide[i]));
  LocalFree(wide);
  return arguments;
}

std::vector<std::filesystem::path> Paths(const std::vector<std::string>& texts) {
  std::vector<std::filesystem::path> paths;
  for (const std::string& text : texts) {
    const std::vector<std::filesystem::path> files = FilesMatching(PathFromUtf8(text));
    if (files.empty()) throw CLI::ValidationError(text, "no such file");
    paths.insert(paths.end(), files.begin(), files.end());
  }
  return paths;
}

void AddTextOptions(CLI::App& app, Options& options, Texts& texts) {
  app.add_option("MACRO", texts.macro);
  CLI::Option* const file = app.add_option("FILE", texts.input)->check(kNotEmpty);
  CLI::Option* const each =
      app.add_option("--each", texts.each, "Run the macro on each of these files")
          ->type_name("FILE...")
          ->expected(1, 1 << 20)
          ->check(kNotEmpty)
          ->excludes(file)
          ->group("Text");
  CLI::Option* const output = app.add_option("-o,--output", texts.output, "Write the text to FILE")
                                  ->type_name("FILE")
                                  ->check(kNotEmpty)
                                  ->excludes(each)
                                  ->group("Text");
  app.add_flag("-i,--in-place", options.inPlace, "Replace the file after success, in one step")
      ->excludes(output)
      ->group("Text");
}

void AddMacroOptions(CLI::App& app, Options& options, Texts& texts) {
  const auto add = [&app](const char* name, auto& value, const char* type, const char* help) {
    return app.add_option(name, value, help)->type_name(type)->group("Macro");
  };
  add("--arg", texts.arguments, "NAME=VALUE", "Argument of the macro; may be repeated")
      ->allow_extra_args(false);
  add("--answer", options.run.answers, "TEXT", "Answer to a prompt; may be repeated")
      ->allow_extra_args(false);
  add("--repeat", options.run.repeat, "N", "Run the macro N times on the same text")
      ->check(Between(1u, 1000000000u, "a whole number of at least 1"));
  add("--timeout", options.run.timeout, "SECONDS", "Stop a run after that time, prompts excluded")
      ->check(Between(0.001, 1e9, "a number of seconds above 0, such as 2 or 0.5"));
  app.add_flag("--keep-going", options.run.keepGoing, "Continue the macro after a wrong call")
      ->group("Macro");
  add("--engine", options.language.engine, "PROGID", "Script engine (default: by the extension)");
  add("--description", texts.description, "FILE", "Language description file")
      ->excludes("--engine");
  add("--module", texts.module, "FILE", "Module (default: scriptruby.dll beside macrorun)");
}

void AddReportOptions(CLI::App& app, Options& options, Texts& texts) {
  const auto flag = [&app](const char* name, bool& value, const char* help) {
    app.add_flag(name, value, help)->group("Reports, on standard error");
  };
  app.add_option("--errors", texts.errors, "Text, or one JSON object per line")
      ->type_name("text|json")
      ->check(CLI::IsMember({"text", "json"}).description(""))
      ->group("Reports, on standard error");
  flag("--trace", options.run.trace, "Show every call, and the module's debug lines");
  flag("--profile", options.run.profile, "Show calls and time of each macro function");
  app.add_option("--log", texts.log, "Log file for the module's failed assertions")
      ->type_name("FILE")
      ->group("Reports, on standard error");
}

void AddTestOptions(CLI::App& app, Options& options, Texts& texts) {
  CLI::Option* const test =
      app.add_option("--test", texts.test, "Test the macros in DIR, or one, with NAME.in");
  test->type_name("DIR|MACRO")->group("Tests");
  for (const char* name : {"MACRO", "FILE", "--each", "--output", "--in-place"})
    test->excludes(app.get_option(name));
  app.add_flag("--promote", options.promote, "Replace each NAME.out by its macro's text")
      ->needs(test)
      ->group("Tests");
}

void AddOtherModes(CLI::App& app, Options& options, Texts& texts) {
  app.set_help_flag("-h,--help", "Show this help")->group("Instead of running");
  app.add_option("--check", texts.check, "Report the syntax errors of these macros")
      ->type_name("MACRO...")
      ->expected(1, 1 << 20)
      ->group("Instead of running");
  app.add_option("--record", texts.record, "Print a macro made from recorded steps (JSON)")
      ->type_name("STEPS")
      ->group("Instead of running");
  app.add_flag("--functions{text}", options.functions,
               "List the macro functions (=markdown: as a page)")
      ->check(CLI::IsMember({"text", "markdown"}).description(""))
      ->group("Instead of running");
  app.add_flag("--stubs", options.stubs, "Print them as Ruby methods, for completion")
      ->group("Instead of running");
  app.add_flag("--version", options.version, "Show the versions of macrorun and of the module")
      ->group("Instead of running");
}

void ReadArguments(const std::vector<std::string>& texts, Options& options) {
  for (const std::string& text : texts) {
    const std::size_t equals = text.find('=');
    if (equals == text.npos || equals == 0)
      throw CLI::ValidationError("--arg " + text, "expected NAME=VALUE");
    options.run.arguments[text.substr(0, equals)] = text.substr(equals + 1);
  }
}

void Convert(const Texts& texts, Options& options) {
  options.run.macro = PathFromUtf8(texts.macro);
  options.each = !texts.each.empty();
  options.inputs = Paths(texts.each);
  if (!texts.input.empty()) options.inputs = {PathFromUtf8(texts.input)};
  options.output = PathFromUtf8(texts.output);
  options.language.description = PathFromUtf8(texts.description);
  options.module =
      texts.module.empty() ? ProgramFolder() / "scriptruby.dll" : PathFromUtf8(texts.module);
  options.log = PathFromUtf8(texts.log);
  options.test = PathFromUtf8(texts.test);
  options.check = Paths(texts.check);
  options.record = PathFromUtf8(texts.record);
  options.jsonErrors = texts.errors == "json";
  ReadArguments(texts.arguments, options);
}

// The option that replaces running a macro; empty for running.
std::string Mode(const Options& options) {
  const std::pair<const char*, bool> modes[] = {{"--test", !options.test.empty()},
                                                {"--record", !options.record.empty()},
                                                {"--functions", !options.functions.empty()},
                                                {"--stubs", options.stubs},
                                                {"--version", options.version},
                                                {"--check", !options.check.empty()}};
  std::string mode;
  for (const auto& [name, given] : modes) {
    if (given && !mode.empty())
      throw CLI::ParseError(mode + " and " + name + " cannot be combined", kWrongUsage);
    if (given) mode = name;
  }
  return mode;
}

// Rules that the library cannot express.
void CheckCombination(const Options& options) {
  const std::string mode = Mode(options);
  const bool records = mode == "--record";
  if (mode.empty() && options.run.macro.empty()) throw CLI::RequiredError("MACRO");
  if (records && !(options.run.macro.empty() && options.inputs.empty()))
    throw CLI::ValidationError(mode, "takes no macro and no text (use -o to name the new macro)");
  if (mode == "--check" && !options.run.macro.empty())
    throw CLI::ValidationError(mode, "unexpected macro before it (name all macros after --check)");
  if (mode == "--check" && !(options.inputs.empty() && options.output.empty()))
    throw CLI::ValidationError(mode, "takes no text and no -o");
  if (!options.inPlace) return;
  if (options.inputs.empty()) throw CLI::ValidationError("--in-place", "needs a FILE to replace");
  for (const std::filesystem::path& input : options.inputs)
    if (input == "-") throw CLI::ValidationError("--in-place", "cannot replace standard input");
}

// The message for unexpected arguments. An unknown option is named first: it can make others
// unexpected.
std::string ExtrasText(const std::vector<std::string>& rest) {
  for (const std::string& argument : rest)
    if (argument.starts_with('-')) return "unknown option " + argument;
  std::string text = "unexpected arguments:";
  for (const std::string& argument : rest) text += " " + argument;
  return text + " (use --each for several files)";
}

int Refuse(const std::string& text) {
  std::fprintf(stderr, "macrorun: %s\n%smacrorun --help lists the options.\n", text.c_str(),
               kUsage);
  return kWrongUsage;
}

}  // namespace

std::optional<int> ParseOptions(Options& options) {
  Texts texts;
  CLI::App app("Runs a macro on a text and prints the result.", "macrorun");
  app.allow_windows_style_options(false);  // "/x/y" is a path
  app.formatter(std::make_shared<HelpFormatter>());
  app.get_formatter()->column_width(29);
  app.footer(kFooter);
  AddTextOptions(app, options, texts);
  AddMacroOptions(app, options, texts);
  AddTestOptions(app, options, texts);
  AddReportOptions(app, options, texts);
  AddOtherModes(app, options, texts);
  try {
    app.parse(ReversedArguments());
    Convert(texts, options);
    CheckCombination(options);
  } catch (const CLI::Success& request) {
    return app.exit(request);
  } catch (const CLI::ExtrasError&) {
    return Refuse(ExtrasText(app.remaining()));
  } catch (const CLI::ParseError& error) {
    return Refuse(error.what());
  }
  return std::nullopt;
}
