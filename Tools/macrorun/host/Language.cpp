// SPDX-License-Identifier: MIT
#include "host/Language.h"

#include <windows.h>

#include <algorithm>
#include <cstring>
#include <cwchar>
#include <system_error>

#include "platform/Encoding.h"
#include "platform/ExitCode.h"
#include "platform/Files.h"
#include "platform/ProgramFile.h"

namespace fs = std::filesystem;

namespace {

// The module cuts a ProgID after that many characters.
constexpr std::size_t kLongestEngine = 18;

constexpr char kRubyEngine[] = "RubyScript";
constexpr std::string_view kRubyEngines[] = {kRubyEngine, "Tarn.RubyScript", "Tarn.RubyScript.1"};

bool EqualIgnoringCase(std::string_view left, std::string_view right) {
  return left.size() == right.size() && _strnicmp(left.data(), right.data(), left.size()) == 0;
}

std::string EngineOf(const fs::path& description) {
  wchar_t name[kLongestEngine + 1];
  GetPrivateProfileStringW(L"Options", L"Language", L"RubyScript", name,
                           static_cast<DWORD>(std::size(name)), fs::absolute(description).c_str());
  return WideToUtf8(name);
}

bool IsRubyMacro(const fs::path& macro) {
  return _wcsicmp(macro.extension().c_str(), L".rbs") == 0;
}

// The description for the macro's extension; the file may be missing.
fs::path DescriptionFor(const fs::path& macro) {
  const std::wstring extension = macro.extension().wstring();
  const std::wstring language = extension.empty() ? extension : extension.substr(1);
  return ProgramFolder() / "languages" / (language + L".qwsh");
}

Language Described(const fs::path& description) { return {description, EngineOf(description)}; }

}  // namespace

Language ChooseLanguage(const LanguageOptions& options, const fs::path& macro) {
  if (options.engine.size() > kLongestEngine)
    throw UsageError("--engine " + options.engine + ": the name has more than " +
                     std::to_string(kLongestEngine) + " characters");
  if (!options.engine.empty()) return {{}, options.engine};
  if (!options.description.empty()) {
    RequireReadable(options.description, "language description (--description)");
    return Described(options.description);
  }
  if (IsRubyMacro(macro)) return {{}, kRubyEngine};
  const fs::path file = DescriptionFor(macro);
  if (HasLanguage(macro)) return Described(file);
  if (_wcsicmp(macro.extension().c_str(), L".rb") == 0)
    throw UsageError(ToUtf8(macro) +
                     ": the name of a Ruby macro ends in .rbs; rename the file, or use "
                     "--engine RubyScript");
  throw UsageError("no language description for " + ToUtf8(macro) + " (" + ToUtf8(file) +
                   "); use --engine or --description");
}

bool IsRubyEngine(std::string_view engine) {
  return std::ranges::any_of(
      kRubyEngines, [engine](std::string_view name) { return EqualIgnoringCase(engine, name); });
}

bool HasLanguage(const fs::path& macro) {
  std::error_code error;
  return IsRubyMacro(macro) || fs::is_regular_file(DescriptionFor(macro), error);
}
