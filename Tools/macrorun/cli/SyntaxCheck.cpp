// SPDX-License-Identifier: MIT
#include "cli/SyntaxCheck.h"

#include <activscp.h>
#include <oleauto.h>

#include <algorithm>
#include <cwchar>
#include <map>
#include <memory>
#include <sstream>

#include "host/EngineWatch.h"
#include "host/Language.h"
#include "host/ParseSite.h"
#include "platform/Encoding.h"
#include "platform/ErrorCapture.h"
#include "platform/Files.h"

namespace fs = std::filesystem;

namespace {

struct Release {
  void operator()(IUnknown* object) const { object->Release(); }
};
template <class Interface>
using Held = std::unique_ptr<Interface, Release>;

// One unit for each byte, as in the module.
std::wstring Widened(const std::string& bytes) {
  std::wstring text;
  for (const char byte : bytes) text += static_cast<unsigned char>(byte);
  return text;
}

class Checker {
 public:
  Checker(const Options& checkOptions, Reporter& checkReporter)
      : options(checkOptions), reporter(checkReporter) {}

  ExitCode Check(const fs::path& macro);

 private:
  ExitCode Parse(const fs::path& macro, const std::string& engineName);
  void ReportWarnings(const std::string& warnings, const fs::path& macro);
  HRESULT ParseWith(IActiveScript* engine, ParseSite& site, const std::wstring& text);

  const Options& options;
  Reporter& reporter;
  std::unique_ptr<EngineWatch> watch;  // for the engine of the last macro
  std::string watched;
};

ExitCode Checker::Check(const fs::path& macro) try {
  const std::string engine = ChooseLanguage(options.language, macro).engine;
  if (!watch || watched != engine) {
    watch.reset();  // only one may exist
    watch = std::make_unique<EngineWatch>(engine);
    watched = engine;
  }
  return Parse(macro, engine);
} catch (const UsageError& error) {
  reporter.Error(PlainDiagnostic("file", {}, error.what()));
  return kWrongUsage;
}

ExitCode Checker::Parse(const fs::path& macro, const std::string& engineName) {
  RequireMacro(macro);
  const std::wstring text = Widened(ReadInput(macro));
  CLSID classId;
  IActiveScript* created = nullptr;
  HRESULT result = CLSIDFromProgID(PathFromUtf8(engineName).c_str(), &classId);
  if (SUCCEEDED(result))
    result = CoCreateInstance(classId, nullptr, CLSCTX_INPROC_SERVER, IID_IActiveScript,
                              reinterpret_cast<void**>(&created));
  if (FAILED(result))
    throw UsageError("cannot create the script engine " + engineName + ": " +
                     SystemMessage(static_cast<unsigned long>(result)));
  const Held<IActiveScript> engine(created);
  ParseSite site(ToUtf8(macro));
  ErrorCapture warnings;
  result = ParseWith(engine.get(), site, text);
  engine->Close();
  ReportWarnings(warnings.Take(), macro);
  if (std::optional<Diagnostic> error = site.TakeError())
    reporter.Error(std::move(*error));
  else if (FAILED(result))
    reporter.Error(
        PlainDiagnostic("engine", macro, SystemMessage(static_cast<unsigned long>(result))));
  return FAILED(result) ? kMacroFailed : kSuccess;
}

// An engine that only parses writes its warnings to standard error.
void Checker::ReportWarnings(const std::string& warnings, const fs::path& macro) {
  std::istringstream lines(warnings);
  for (std::string line; std::getline(lines, line);)
    reporter.Message(WithFile(line.substr(0, line.find('\r')), ToUtf8(macro)));
}

HRESULT Checker::ParseWith(IActiveScript* engine, ParseSite& site, const std::wstring& text) {
  IActiveScriptParse* created = nullptr;
  HRESULT result = engine->QueryInterface(kActiveScriptParse, reinterpret_cast<void**>(&created));
  if (FAILED(result)) return result;
  const Held<IActiveScriptParse> parser(created);
  result = engine->SetScriptSite(&site);
  if (SUCCEEDED(result)) result = parser->InitNew();
  // Engines that handle the module's text as bytes recognise it by this name.
  if (SUCCEEDED(result)) result = engine->AddNamedItem(L"tarn", SCRIPTITEM_ISVISIBLE);
  EXCEPINFO exception = {};
  if (SUCCEEDED(result))
    result = parser->ParseScriptText(text.c_str(), nullptr, nullptr, nullptr, 0, 0, 0, nullptr,
                                     &exception);
  SysFreeString(exception.bstrSource);
  SysFreeString(exception.bstrDescription);
  SysFreeString(exception.bstrHelpFile);
  return result;
}

}  // namespace

ExitCode CheckMacros(const Options& options, Reporter& reporter) {
  Checker checker(options, reporter);
  ExitCode worst = kSuccess;
  for (const fs::path& macro : options.check) worst = std::max(worst, checker.Check(macro));
  return worst;
}
