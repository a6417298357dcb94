// SPDX-License-Identifier: MIT
#include "host/RunServices.h"

#include <system_error>

#include "host/RunControl.h"
#include "platform/Console.h"
#include "platform/Encoding.h"
#include "platform/ExitCode.h"
#include "platform/Files.h"

namespace fs = std::filesystem;

namespace {

// Far below the limit of the stack.
constexpr std::size_t kDeepest = 16;

// Why a macro cannot be run; empty when it can.
std::string Unreadable(const fs::path& macro) try {
  RequireMacro(macro);
  return {};
} catch (const UsageError& error) {
  return error.what();
}

}  // namespace

void RunServices::Message(const std::string& text) {
  reporter.Message(WithFile(text, ToUtf8(macros.back())));
}

std::optional<std::string> RunServices::Prompt(const std::string& question,
                                               const std::optional<std::string>& proposal) {
  if (answersTaken < options.answers.size()) return options.answers[answersTaken++];
  return IsTerminal(stdin) ? AskUser(question, proposal.value_or("")) : proposal;
}

std::optional<std::string> RunServices::AskUser(const std::string& question,
                                                const std::string& proposal) {
  reporter.EndProgress();
  WriteError(question + (proposal.empty() ? " " : " [" + proposal + "] "), Colour::kHighlight);
  control->Pause();
  std::optional<std::string> answer =
      ReadTerminalLine([this] { return control->StopCause() != RunControl::Cause::kNone; });
  control->Resume();
  if (answer && answer->empty()) answer = proposal;
  return answer;
}

std::optional<std::string> RunServices::MacroArgument(const std::string& name) {
  argumentsRead.insert(name);
  const auto argument = options.arguments.find(name);
  if (argument == options.arguments.end()) return {};
  return argument->second;
}

bool RunServices::RunMacro(const fs::path& macro) {
  const fs::path file = macros.back().parent_path() / macro;
  std::error_code error;
  std::string reason;
  if (!fs::is_regular_file(file, error))
    reason = "no such macro: " + ToUtf8(file);
  else if (macros.size() >= kDeepest)
    reason = "run_macro is nested more than " + std::to_string(kDeepest) + " deep";
  else
    reason = Unreadable(file);
  if (reason.empty()) return nested.RunNested(file);
  reporter.Error(PlainDiagnostic("call", macros.back(), std::move(reason)));
  return false;
}
