// SPDX-License-Identifier: MIT
#include "MacroRun.h"

#include <cstdio>
#include <memory>
#include <new>
#include <string_view>
#include <vector>

#include "EngineManifest.h"
#include "HostLink.h"
#include "MacroFunctions.h"
#include "xLib/xTexts.h"

namespace {

class MacroRun {
 public:
  MacroRun(Document& text, TextPassage textPassage, bool traceLines)
      : document(text), passage(textPassage), trace(traceLines) {
    const HostCallbacks callbacks = {this, OnReport, OnTrace, OnFunctionId, OnCall};
    link.reset(CreateHostLink(&callbacks));
    if (!link) throw std::bad_alloc();
  }

  ExitCode Run(ScriptModule& module, const std::filesystem::path& macro) {
    const int result = module.Execute(macro, HostLinkInterface(link.get()));
    if (faulted) return kFault;
    if (HostLinkStopCause(link.get()) == kStoppedByUser) return kStopped;
    // An engine may count a macro as run although it has reported an error in it.
    return result == 1 && !scriptError ? kSuccess : kMacroFailed;
  }

 private:
  struct DestroyLink {
    void operator()(HostLink* object) const { DestroyHostLink(object); }
  };

  // The callbacks. None may let an exception out.
  static MacroRun& From(void* context) { return *static_cast<MacroRun*>(context); }
  static void OnReport(void* context, const char* text) { From(context).Report(text); }
  static void OnTrace(void* context, const char* text) {
    if (From(context).trace) std::fputs(text, stderr);
  }
  static std::uint32_t OnFunctionId(void*, const char* name) { return MacroFunctionId(name); }
  static bool OnCall(void* context, std::uint32_t id) { return From(context).Call(id); }

  void Report(std::string_view text) noexcept;
  bool Call(std::uint32_t id) noexcept;
  void SetResult(const MacroResult& result);

  Document& document;
  const TextPassage passage;
  const bool trace;
  bool scriptError = false;
  bool faulted = false;
  std::unique_ptr<HostLink, DestroyLink> link;
};

// The beginnings of some reports tell more than the result of `execute` does.
void MacroRun::Report(std::string_view text) noexcept {
  if (text.starts_with(kScriptErrorReport)) scriptError = true;
  if (text.starts_with(kFaultReport)) faulted = true;
  std::fwrite(text.data(), 1, text.size(), stderr);
  if (!text.ends_with('\n')) std::fputc('\n', stderr);
}

bool MacroRun::Call(std::uint32_t id) noexcept try {
  std::vector<HostArgument> arguments;
  for (std::uint32_t i = 0; i < HostLinkArgumentCount(link.get()); ++i)
    arguments.push_back(HostLinkArgument(link.get(), i));
  SetResult(CallMacroFunction(id, document, arguments, passage));
  return true;
} catch (const std::exception& error) {
  std::fprintf(stderr, "macrorun: %s\n", error.what());
  return false;
}

void MacroRun::SetResult(const MacroResult& result) {
  if (const std::string* text = std::get_if<std::string>(&result)) {
    if (!HostLinkSetText(link.get(), text->c_str())) throw std::bad_alloc();
  } else {
    HostLinkSetInteger(link.get(), std::get<std::int32_t>(result));
  }
}

}  // namespace

ExitCode RunMacro(ScriptModule& module, const std::filesystem::path& macro, Document& document,
                  bool trace) {
  if (!module.RunsRuby())
    return MacroRun(document, TextPassage::kCharacters, trace).Run(module, macro);
  const EngineManifest manifest;
  return MacroRun(document, TextPassage::kBytes, trace).Run(module, macro);
}
