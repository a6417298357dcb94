// SPDX-License-Identifier: MIT
// Finds the tests in a folder of macros by the names of its files.
//
// NAME.in and NAME.out belong to the macros NAME of all languages. NAME.CASE.in and NAME.CASE.out
// are a further test of them, unless there is a macro NAME.CASE. A macro without such files has one
// test.
//
// Errors: UsageError. Threading: any thread.
#pragma once

#include <filesystem>
#include <string>
#include <vector>

struct MacroTest {
  std::filesystem::path Input() const { return Beside(L".in"); }
  std::filesystem::path Expected() const { return Beside(L".out"); }

  std::filesystem::path macro;
  std::wstring textCase;  // empty: NAME.in

 private:
  std::filesystem::path Beside(const wchar_t* extension) const;
};

struct TestFolder {
  // `given` is a folder or a macro. In a folder, macros are the files with an extension of a known
  // language.
  explicit TestFolder(const std::filesystem::path& given);

  std::vector<MacroTest> tests;  // by language, by name, by case
  std::vector<std::filesystem::path>
      orphans;  // texts without a macro; empty when `given` is a macro
};

// The name in lower case, to compare file names.
std::wstring Folded(const std::filesystem::path& path);
