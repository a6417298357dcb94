// SPDX-License-Identifier: MIT
#include "cli/Batch.h"

#include <algorithm>

#include "host/EngineWatch.h"
#include "host/Language.h"
#include "host/MacroRun.h"
#include "platform/Console.h"
#include "platform/Encoding.h"
#include "platform/Files.h"

namespace fs = std::filesystem;

namespace {

class Batch {
 public:
  Batch(const Options& runOptions, Reporter& runReporter)
      : options(runOptions),
        reporter(runReporter),
        language(ChooseLanguage(options.language, options.run.macro)),
        module(options.module, &language),
        engines(language.engine),
        context{options.run, module, language, engines.Running(), reporter, profile} {}

  ExitCode RunOne(const fs::path& input);
  ExitCode RunEach();
  void ShowProfile();
  // Notes about unused input and arguments.
  void ShowUnused(ExitCode outcome);

 private:
  std::string Read(const fs::path& input);
  void Write(const fs::path& input, const std::string& bytes);
  ExitCode RunGuarded(const fs::path& input);

  const Options& options;
  Reporter& reporter;
  const Language language;
  ScriptModule module;
  EngineWatch engines;  // destroyed before the module, which its engines point to
  CallProfile profile;
  RunContext context;
};

// Typed text is read from the console, other text as bytes.
std::string Batch::Read(const fs::path& input) {
  if (input != "-" || !IsTerminal(stdin)) return ReadInput(input);
  reporter.Note(
      "type the text; to end it, press Ctrl+Z (under Wine Ctrl+D) on an empty line, then "
      "Enter");
  return ReadTerminalText();
}

ExitCode Batch::RunOne(const fs::path& input) {
  if (options.inPlace) RequireReplaceable(input, true);
  Editor editor(Document(Read(input)), input == "-" ? fs::path() : input);
  if (const ExitCode code = RunMacro(context, editor); code != kSuccess) return code;
  Write(input, editor.First().Bytes());
  return kSuccess;
}

void Batch::Write(const fs::path& input, const std::string& bytes) {
  reporter.EndProgress();
  if (options.inPlace)
    ReplaceFileBytes(input, bytes);
  else if (!options.output.empty())
    ReplaceFileBytes(options.output, bytes);
  else
    WriteStandardOutput(bytes);
}

// If one file fails, the others are still processed.
ExitCode Batch::RunGuarded(const fs::path& input) try {
  return RunOne(input);
} catch (const UsageError& error) {
  reporter.Error(PlainDiagnostic("file", {}, error.what()));
  return kWrongUsage;
}

ExitCode Batch::RunEach() {
  ExitCode worst = kSuccess;
  std::size_t done = 0, succeeded = 0;
  for (const fs::path& input : options.inputs) {
    reporter.Progress(++done, options.inputs.size(), ToUtf8(input));
    const ExitCode code = RunGuarded(input);
    succeeded += code == kSuccess;
    if (code != kSuccess) reporter.Note(ToUtf8(input) + ": failed");
    worst = std::max(worst, code);
    if (code == kStopped || code == kFault) break;
  }
  std::string summary = std::to_string(succeeded) + " of " + std::to_string(options.inputs.size()) +
                        " files done, " + std::to_string(done - succeeded) + " failed";
  if (done < options.inputs.size())
    summary += ", " + std::to_string(options.inputs.size() - done) + " not started";
  reporter.Note(summary);
  return worst;
}

void Batch::ShowProfile() {
  reporter.EndProgress();
  if (options.run.profile) reporter.Profile(profile.Table());
}

void Batch::ShowUnused(ExitCode outcome) {
  if (options.inputs.empty() && InputIsLeft())
    reporter.Note("the macro started with an empty text (use - as FILE to read standard input)");
  if (outcome != kSuccess) return;  // it may have ended before it read them
  for (const auto& [name, value] : options.run.arguments)
    if (!context.argumentsRead.contains(name))
      reporter.Note("--arg " + name + ": the macro did not read it");
}

}  // namespace

ExitCode RunBatch(const Options& options, Reporter& reporter) {
  RequireMacro(options.run.macro);
  if (!options.output.empty()) RequireReplaceable(options.output, false);
  Batch batch(options, reporter);
  const ExitCode code =
      options.each ? batch.RunEach()
                   : batch.RunOne(options.inputs.empty() ? fs::path() : options.inputs.front());
  batch.ShowProfile();
  batch.ShowUnused(code);
  return code;
}
