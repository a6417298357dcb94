// SPDX-License-Identifier: MIT
#include "host/MacroRun.h"

#include <chrono>
#include <cstdio>
#include <map>
#include <memory>
#include <new>
#include <string_view>
#include <utility>
#include <vector>

#include "functions/MacroFunctions.h"
#include "host/ArgumentCopies.h"
#include "host/DiagnosticCollector.h"
#include "host/HostLink.h"
#include "host/RubyCallChain.h"
#include "host/RunControl.h"
#include "host/RunServices.h"
#include "platform/Encoding.h"
#include "platform/Files.h"
#include "report/CallText.h"

namespace fs = std::filesystem;

namespace {

using Clock = std::chrono::steady_clock;

class MacroRun final : public NestedRunner {
 public:
  MacroRun(RunContext& runContext, Editor& runEditor);
  ExitCode Run();

 private:
  struct DestroyLink {
    void operator()(HostLink* object) const { DestroyHostLink(object); }
  };
  using Arguments = std::vector<HostArgument>;

  // The callbacks. No exception may leave them.
  static MacroRun& From(void* context) { return *static_cast<MacroRun*>(context); }
  static void OnReport(void* context, const char* text) { From(context).diagnostics.Take(text); }
  static void OnTrace(void* context, const char* text) { From(context).TraceLine(text); }
  static std::uint32_t OnFunctionId(void* context, const char* name) {
    return From(context).FunctionId(name);
  }
  static bool OnCall(void* context, std::uint32_t id) { return From(context).Call(id); }
  static void OnStopping(void* context) { From(context).Stopping(); }

  void TraceLine(std::string_view text) noexcept;
  std::uint32_t FunctionId(const char* name) noexcept;
  bool Call(std::uint32_t id) noexcept;
  void Stopping() noexcept;
  std::string CallChain();
  MacroResult Perform(std::uint32_t id, const std::string& name, const Arguments& arguments);
  bool WrongCallMade(const std::string& name, const WrongCall& wrong);
  void SetResult(const MacroResult& result);
  bool Execute(const fs::path& macro);
  bool RunNested(const fs::path& macro) override;
  ExitCode Outcome(bool succeeded);

  RunContext& context;
  Editor& editor;
  const ResultEncoding encoding;
  std::map<std::uint32_t, std::string> names;
  DiagnosticCollector diagnostics;
  bool leftByJump = false;  // a stop has left an engine that must not be used
  std::unique_ptr<HostLink, DestroyLink> link;
  std::unique_ptr<RunControl> control;
  RunServices services;
};

MacroRun::MacroRun(RunContext& runContext, Editor& runEditor)
    : context(runContext),
      editor(runEditor),
      encoding(runContext.language.IsRuby() ? ResultEncoding::kBytes : ResultEncoding::kCharacters),
      diagnostics(runContext.reporter),
      services(runContext.options, runContext.reporter, *this, runContext.argumentsRead) {
  const HostCallbacks callbacks = {this, OnReport, OnTrace, OnFunctionId, OnCall, OnStopping};
  link.reset(CreateHostLink(&callbacks));
  if (!link) throw std::bad_alloc();
}

ExitCode MacroRun::Run() {
  control = std::make_unique<RunControl>(context.module, context.engines, context.reporter,
                                         context.options.timeout);
  services.SetControl(control.get());
  const Clock::time_point begin = Clock::now();
  const bool succeeded = Execute(context.options.macro);
  context.profile.AddRun(Clock::now() - begin);
  const ExitCode outcome = Outcome(succeeded);
  if (leftByJump || outcome == kFault) context.engines.Abandon();
  return outcome;
}

ExitCode MacroRun::Outcome(bool succeeded) {
  const RunControl::Cause cause = control->StopCause();
  control.reset();
  if (diagnostics.Faulted()) return kFault;
  // A stop request that came after the end of the macro does not count.
  if (cause != RunControl::Cause::kNone && !succeeded) {
    Diagnostic report = diagnostics.Stop();
    report.kind = "stop";
    report.message = cause == RunControl::Cause::kUser ? "stopped" : "timed out";
    if (report.file.empty()) report.file = ToUtf8(context.options.macro);
    context.reporter.Error(std::move(report));
    return kStopped;
  }
  return succeeded ? kSuccess : kMacroFailed;
}

// Calls `execute`, for the outermost or a nested run; whether the macro succeeded.
bool MacroRun::Execute(const fs::path& macro) {
  const std::string name = ScriptModule::NameOf(macro);
  const DiagnosticCollector::Scope scope(diagnostics, {name, ToUtf8(macro)});
  const EditorStep step(editor);
  services.EnterMacro(macro);
  const int result = context.module.Execute(name, HostLinkInterface(link.get()));
  services.LeaveMacro();
  leftByJump |= HostLinkStopCause(link.get()) != kNotStopped;
  const bool stopped = control->StopCause() != RunControl::Cause::kNone;
  diagnostics.EndRun(stopped);
  // An engine can report an error and return success.
  return result == 1 && !diagnostics.ErrorSeen();
}

bool MacroRun::RunNested(const fs::path& macro) {
  const HostNesting nesting = HostLinkBeginNested(link.get());
  const bool succeeded = Execute(macro);
  HostLinkEndNested(link.get(), &nesting);
  return succeeded;
}

void MacroRun::TraceLine(std::string_view text) noexcept {
  if (!context.options.trace) return;
  context.reporter.Trace(text.substr(0, text.find_last_not_of("\r\n") + 1));
}

std::uint32_t MacroRun::FunctionId(const char* name) noexcept {
  const std::uint32_t id = MacroFunctionId(name);
  if (id != kUnknownId) names.try_emplace(id, name);
  return id;
}

bool MacroRun::Call(std::uint32_t id) noexcept try {
  const std::string name = names[id];
  const ArgumentCopies arguments(link.get());
  try {
    SetResult(Perform(id, name, arguments.List()));
    return !diagnostics.Faulted();
  } catch (const WrongCall& wrong) {
    return WrongCallMade(name, wrong);
  }
} catch (const std::exception& error) {
  diagnostics.Add(PlainDiagnostic("fault", {}, error.what()));
  return false;
}

void MacroRun::Stopping() noexcept {
  Diagnostic place;
  place.file = diagnostics.File();
  SetCallChain(place, CallChain());
  diagnostics.AddStop(std::move(place));
}

// Empty for an engine that cannot report it.
std::string MacroRun::CallChain() {
  ScriptEngineProxy* const engine = context.engines.Innermost();
  return engine && context.language.IsRuby() ? RubyCallChain(*engine) : std::string();
}

MacroResult MacroRun::Perform(std::uint32_t id, const std::string& name,
                              const Arguments& arguments) {
  const bool trace = context.options.trace;
  if (!trace && !context.options.profile)
    return CallMacroFunction(id, editor, services, arguments, encoding);
  const std::string call = trace ? CallText(name, arguments) : "";
  const Clock::time_point begin = Clock::now();
  try {
    MacroResult result = CallMacroFunction(id, editor, services, arguments, encoding);
    context.profile.AddCall(name, Clock::now() - begin);
    if (trace) context.reporter.Trace(call + " -> " + ResultText(result));
    return result;
  } catch (const WrongCall&) {
    context.profile.AddCall(name, Clock::now() - begin);
    if (trace) context.reporter.Trace(call + " -> wrong call");
    throw;
  }
}

// Whether the macro continues.
bool MacroRun::WrongCallMade(const std::string& name, const WrongCall& wrong) {
  if (control->StopCause() != RunControl::Cause::kNone) {  // an interrupted prompt
    Stopping();
    return false;
  }
  Diagnostic report;
  report.kind = "call";
  report.function = wrong.function.empty() ? name : wrong.function;
  report.argument = static_cast<int>(wrong.argument);
  report.expected = wrong.expected;
  report.message = wrong.what();
  report.file = diagnostics.File();
  SetCallChain(report, CallChain());
  diagnostics.Add(std::move(report));
  return context.options.keepGoing;
}

void MacroRun::SetResult(const MacroResult& result) {
  if (const std::string* text = std::get_if<std::string>(&result)) {
    if (!HostLinkSetText(link.get(), text->c_str())) throw std::bad_alloc();
  } else {
    HostLinkSetInteger(link.get(), std::get<std::int32_t>(result));
  }
}

}  // namespace

ExitCode RunMacro(RunContext& context, Editor& editor) {
  for (unsigned i = 0; i < context.options.repeat; ++i)
    if (const ExitCode code = MacroRun(context, editor).Run(); code != kSuccess) return code;
  return kSuccess;
}
