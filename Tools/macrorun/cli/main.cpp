// SPDX-License-Identifier: MIT
// macrorun: runs macros on texts without the editor. It hosts the scripting module as the editor
// does.
//
// Reader's path: main -> Batch (the texts) -> MacroRun (the host) -> HostLink (its Microsoft-ABI
// side) -> ScriptModule (the exports) -> MacroFunctions (what a macro can call) -> Document.
#include <windows.h>

#include <cstdio>
#include <exception>
#include <filesystem>
#include <optional>
#include <string>
#include <vector>

#include "cli/Batch.h"
#include "cli/MacroTests.h"
#include "cli/Options.h"
#include "cli/SyntaxCheck.h"
#include "functions/FunctionReference.h"
#include "host/Language.h"
#include "host/RunControl.h"
#include "host/ScriptModule.h"
#include "platform/Console.h"
#include "platform/Encoding.h"
#include "platform/ExitCode.h"
#include "platform/Files.h"
#include "recording/LanguageTemplates.h"
#include "recording/MacroComposer.h"
#include "recording/Recording.h"
#include "report/Reporter.h"

namespace {

// Without a macro, an engine or a description, the module uses the description that it finds.
ExitCode PrintVersions(const Options& options) {
  std::optional<Language> language;
  if (!options.run.macro.empty() || !options.language.engine.empty() ||
      !options.language.description.empty())
    language = ChooseLanguage(options.language, options.run.macro);
  ScriptModule module(options.module, language ? &*language : nullptr);
  std::printf("macrorun %s\n%s\n", MACRORUN_VERSION, module.Description().c_str());
  return kSuccess;
}

// Writes to --output, or to standard output.
ExitCode Write(const Options& options, const std::string& text) {
  if (options.output.empty()) {
    WriteStandardOutput(text);
  } else {
    RequireReplaceable(options.output, false);
    ReplaceFileBytes(options.output, text);
  }
  return kSuccess;
}

// Converts a recording to a macro; in Ruby unless the options choose another language.
ExitCode WriteRecorded(const Options& options) {
  const std::vector<RecordedStep> steps = ReadRecording(options.record);
  const Language language =
      ChooseLanguage(options.language, options.output.empty() ? "macro.rbs" : options.output);
  ScriptModule module(options.module, &language);
  return Write(options, MacroComposer(TemplatesOf(module, language)).Compose(steps));
}

// The module reads the variable when it is loaded, in the ANSI code page, and ignores an invalid
// path.
void SetLog(const std::filesystem::path& file) {
  constexpr std::size_t kLongest = 255;
  if (file.empty()) return;
  const std::filesystem::path path = std::filesystem::absolute(file);
  const std::string refused = "--log " + ToUtf8(file) + ": ";
  std::error_code error;
  if (!std::filesystem::is_directory(path.parent_path(), error))
    throw UsageError(refused + "its folder does not exist");
  RequireReplaceable(path, false);
  const std::optional<std::filesystem::path> named = AnsiNamed(path);
  if (!named) throw UsageError(refused + "the system's code page cannot represent it");
  if (ToAnsi(*named).size() > kLongest)
    throw UsageError(refused + "the full path has more than " + std::to_string(kLongest) +
                     " characters");
  _wputenv_s(L"SCRIPTRUBY_LOG", named->c_str());
}

ExitCode Perform(const Options& options, Reporter& reporter) {
  SetLog(options.log);
  if (options.functions == "text") return Write(options, FunctionList());
  if (options.functions == "markdown") return Write(options, FunctionMarkdown());
  if (options.stubs) return Write(options, FunctionStubs());
  if (options.version) return PrintVersions(options);
  if (!options.record.empty()) return WriteRecorded(options);
  RunControl::CatchInterrupts();
  if (!options.check.empty()) return CheckMacros(options, reporter);
  if (!options.test.empty()) return RunMacroTests(options, reporter);
  return RunBatch(options, reporter);
}

ExitCode Fail(Reporter& reporter, const char* kind, const char* text, ExitCode code) {
  reporter.Error(PlainDiagnostic(kind, {}, text));
  return code;
}

}  // namespace

int main() {
  PrepareStandardError();
  // Report a file that is not a library as an error, without a system dialog.
  SetErrorMode(SEM_FAILCRITICALERRORS | SEM_NOOPENFILEERRORBOX);
  SetDllDirectoryW(L"");  // do not load libraries from the current directory
  Options options;
  if (const std::optional<int> finished = ParseOptions(options)) return *finished;
  Reporter reporter(options.jsonErrors ? Reporter::Form::kJson : Reporter::Form::kText);
  try {
    return Perform(options, reporter);
  } catch (const UsageError& error) {
    return Fail(reporter, "usage", error.what(), kWrongUsage);
  } catch (const std::exception& error) {
    return Fail(reporter, "fault", error.what(), kFault);
  }
}
