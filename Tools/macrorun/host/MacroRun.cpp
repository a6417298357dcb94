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
#include "host/HostLink.h"
#include "host/ModuleReports.h"
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
  MacroRun(RunSurroundings& runSurroundings, Editor& runEditor);
  ExitCode Run();

 private:
  struct DestroyLink {
    void operator()(HostLink* object) const { DestroyHostLink(object); }
  };
  using Arguments = std::vector<HostArgument>;

  // The callbacks. None may let an exception out.
  static MacroRun& From(void* context) { return *static_cast<MacroRun*>(context); }
  static void OnReport(void* context, const char* text) { From(context).reports.Take(text); }
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
  MacroResult Perform(std::uint32_t id, const std::string& name, const Arguments& arguments);
  bool WrongCallMade(const std::string& name, const WrongCall& wrong);
  void SetResult(const MacroResult& result);
  bool Execute(const fs::path& macro);
  bool RunNested(const fs::path& macro) override;
  ExitCode Outcome(bool succeeded);

  RunSurroundings& surroundings;
  Editor& editor;
  const TextPassage passage;
  std::map<std::uint32_t, std::string> names;
  ModuleReports reports;
  bool leftByJump = false;  // an engine that must not be touched any more
  std::unique_ptr<HostLink, DestroyLink> link;
  std::unique_ptr<RunControl> control;
  RunServices services;
};

MacroRun::MacroRun(RunSurroundings& runSurroundings, Editor& runEditor)
    : surroundings(runSurroundings),
      editor(runEditor),
      passage(runSurroundings.module.RunsRuby() ? TextPassage::kBytes : TextPassage::kCharacters),
      reports(runSurroundings.reporter, passage == TextPassage::kCharacters),
      services(runSurroundings.options, runSurroundings.reporter, *this,
               runSurroundings.argumentsRead) {
  const HostCallbacks callbacks = {this, OnReport, OnTrace, OnFunctionId, OnCall, OnStopping};
  link.reset(CreateHostLink(&callbacks));
  if (!link) throw std::bad_alloc();
}

ExitCode MacroRun::Run() {
  control = std::make_unique<RunControl>(surroundings.module, surroundings.engines,
                                         surroundings.reporter, surroundings.options.timeout);
  services.SetControl(control.get());
  const Clock::time_point begin = Clock::now();
  const bool succeeded = Execute(surroundings.options.macro);
  surroundings.profile.AddRun(Clock::now() - begin);
  const ExitCode outcome = Outcome(succeeded);
  if (leftByJump || outcome == kFault) surroundings.engines.Abandon();
  return outcome;
}

ExitCode MacroRun::Outcome(bool succeeded) {
  const RunControl::Cause cause = control->StopCause();
  control.reset();
  if (reports.Faulted()) return kFault;
  // A request that came too late for a macro that has ended does not count.
  if (cause != RunControl::Cause::kNone && !succeeded) {
    ErrorReport report = reports.Stop();
    report.kind = "stop";
    report.message = cause == RunControl::Cause::kUser ? "stopped" : "timed out";
    if (report.file.empty()) report.file = ToUtf8(surroundings.options.macro);
    surroundings.reporter.Error(std::move(report));
    return kStopped;
  }
  return succeeded ? kSuccess : kMacroFailed;
}

// One `execute`, outermost or nested: whether the macro has succeeded.
bool MacroRun::Execute(const fs::path& macro) {
  const std::string name = ScriptModule::NameOf(macro);
  const ModuleReports::Scope scope(reports, {name, ToUtf8(macro)});
  const EditorStep step(editor);
  services.EnterMacro(macro);
  const int result = surroundings.module.Execute(name, HostLinkInterface(link.get()));
  services.LeaveMacro();
  leftByJump |= HostLinkStopCause(link.get()) != kNotStopped;
  const bool stopped = control->StopCause() != RunControl::Cause::kNone;
  reports.EndRun(stopped);
  // An engine may count a macro as run although it has reported an error in it.
  return result == 1 && !reports.ErrorSeen();
}

bool MacroRun::RunNested(const fs::path& macro) {
  const HostNesting nesting = HostLinkBeginNested(link.get());
  const bool succeeded = Execute(macro);
  HostLinkEndNested(link.get(), &nesting);
  return succeeded;
}

void MacroRun::TraceLine(std::string_view text) noexcept {
  if (!surroundings.options.trace) return;
  surroundings.reporter.Trace(text.substr(0, text.find_last_not_of("\r\n") + 1));
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
    return !reports.Faulted();
  } catch (const WrongCall& wrong) {
    return WrongCallMade(name, wrong);
  }
} catch (const std::exception& error) {
  reports.Add(PlainError("fault", {}, error.what()));
  return false;
}

void MacroRun::Stopping() noexcept {
  ErrorReport place;
  place.file = reports.File();
  SetCallChain(place, surroundings.engines.CallChain());
  reports.AddStop(std::move(place));
}

MacroResult MacroRun::Perform(std::uint32_t id, const std::string& name,
                              const Arguments& arguments) {
  const bool trace = surroundings.options.trace;
  if (!trace && !surroundings.options.profile)
    return CallMacroFunction(id, editor, services, arguments, passage);
  const std::string call = trace ? CallText(name, arguments) : "";
  const Clock::time_point begin = Clock::now();
  try {
    MacroResult result = CallMacroFunction(id, editor, services, arguments, passage);
    surroundings.profile.AddCall(name, Clock::now() - begin);
    if (trace) surroundings.reporter.Trace(call + " -> " + ResultText(result));
    return result;
  } catch (const WrongCall&) {
    surroundings.profile.AddCall(name, Clock::now() - begin);
    if (trace) surroundings.reporter.Trace(call + " -> wrong call");
    throw;
  }
}

// Whether the macro goes on.
bool MacroRun::WrongCallMade(const std::string& name, const WrongCall& wrong) {
  if (control->StopCause() != RunControl::Cause::kNone) {  // as of a prompt without its answer
    Stopping();
    return false;
  }
  ErrorReport report;
  report.kind = "call";
  report.function = wrong.function.empty() ? name : wrong.function;
  report.argument = static_cast<int>(wrong.argument);
  report.expected = wrong.expected;
  report.message = wrong.what();
  report.file = reports.File();
  SetCallChain(report, surroundings.engines.CallChain());
  reports.Add(std::move(report));
  return surroundings.options.keepGoing;
}

void MacroRun::SetResult(const MacroResult& result) {
  if (const std::string* text = std::get_if<std::string>(&result)) {
    if (!HostLinkSetText(link.get(), text->c_str())) throw std::bad_alloc();
  } else {
    HostLinkSetInteger(link.get(), std::get<std::int32_t>(result));
  }
}

}  // namespace

ExitCode RunMacro(RunSurroundings& surroundings, Editor& editor) {
  RequireMacro(surroundings.options.macro);
  for (unsigned i = 0; i < surroundings.options.repeat; ++i)
    if (const ExitCode code = MacroRun(surroundings, editor).Run(); code != kSuccess) return code;
  return kSuccess;
}
