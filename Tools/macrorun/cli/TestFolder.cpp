// SPDX-License-Identifier: MIT
#include "cli/TestFolder.h"

#include <windows.h>

#include <algorithm>
#include <map>
#include <set>
#include <tuple>

#include "host/Language.h"
#include "platform/Encoding.h"
#include "platform/ExitCode.h"

namespace fs = std::filesystem;

namespace {

struct IgnoringCase {
  bool operator()(const std::wstring& left, const std::wstring& right) const {
    return Folded(left) < Folded(right);
  }
};

// The cases of each NAME of a macro.
using Cases = std::map<std::wstring, std::set<std::wstring, IgnoringCase>, IgnoringCase>;

// Returns names without the folder.
std::vector<fs::path> FilesIn(const fs::path& folder) {
  std::vector<fs::path> files;
  std::error_code error;
  for (fs::directory_iterator entry(folder.empty() ? "." : folder, error), end;
       !error && entry != end; entry.increment(error)) {
    std::error_code ignored;
    if (!entry->is_directory(ignored)) files.push_back(entry->path().filename());
  }
  if (error)
    throw UsageError("cannot read the folder " + ToUtf8(folder) + " (--test): " + error.message());
  return files;
}

bool IsInput(const fs::path& file) { return Folded(file.extension()) == L".in"; }

bool IsText(const fs::path& file) { return IsInput(file) || Folded(file.extension()) == L".out"; }

// Whether the text belongs to a macro. NAME.CASE.out without NAME.CASE.in does not, because the
// case may be misspelt and must not be promoted.
bool AddCase(Cases& cases, const fs::path& folder, const fs::path& text) {
  const fs::path name = text.stem();
  if (const auto macro = cases.find(name); macro != cases.end()) {
    macro->second.insert(L"");
    return true;
  }
  const std::wstring ending = name.extension().wstring();
  const auto macro = cases.find(name.stem());
  if (macro == cases.end() || ending.size() < 2) return false;
  std::error_code error;
  if (!IsInput(text) && !fs::exists(folder / fs::path(text).replace_extension(L".in"), error))
    return false;
  macro->second.insert(ending.substr(1));
  return true;
}

void Sort(std::vector<MacroTest>& tests) {
  const auto key = [](const MacroTest& test) {
    return std::make_tuple(Folded(test.macro.extension()), Folded(test.macro),
                           Folded(test.textCase));
  };
  std::sort(tests.begin(), tests.end(),
            [&](const MacroTest& left, const MacroTest& right) { return key(left) < key(right); });
}

}  // namespace

fs::path MacroTest::Beside(const wchar_t* extension) const {
  fs::path file = fs::path(macro).replace_extension();
  if (!textCase.empty()) file += L"." + textCase;
  return file += extension;
}

TestFolder::TestFolder(const fs::path& given) {
  std::error_code error;
  const bool one = fs::is_regular_file(given, error);
  if (!fs::exists(given, error))
    throw UsageError("--test " + ToUtf8(given) + ": no such folder or macro");
  const fs::path folder = one ? given.parent_path() : given;
  const std::vector<fs::path> files = FilesIn(folder);
  std::vector<fs::path> macros;
  std::copy_if(files.begin(), files.end(), std::back_inserter(macros), HasLanguage);
  if (one) macros.push_back(given.filename());
  Cases cases;
  for (const fs::path& macro : macros) cases[macro.stem()];
  for (const fs::path& file : files)
    if (IsText(file) && !AddCase(cases, folder, file) && !one) orphans.push_back(folder / file);
  if (macros.empty()) throw UsageError("--test " + ToUtf8(folder) + ": no macros in this folder");
  if (one) macros = {given.filename()};
  for (const fs::path& macro : macros) {
    auto& ofMacro = cases[macro.stem()];
    if (ofMacro.empty()) ofMacro.insert(L"");
    for (const std::wstring& textCase : ofMacro)
      tests.push_back({(folder / macro).generic_wstring(), textCase});
  }
  Sort(tests);
}

std::wstring Folded(const fs::path& path) {
  std::wstring text = path.wstring();
  CharLowerBuffW(text.data(), static_cast<DWORD>(text.size()));
  return text;
}
