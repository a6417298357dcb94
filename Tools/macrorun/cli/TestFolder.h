// SPDX-License-Identifier: MIT
// Which tests a folder of macros holds, by the names of its files.
//
// NAME.in and NAME.out belong to every macro NAME, in whatever language. So do NAME.CASE.in and
// NAME.CASE.out, each CASE with an .in a test of its own, unless there is a macro NAME.CASE. A macro
// without any file has one test all the same.
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
  std::wstring textCase;  // empty: that of NAME.in

 private:
  std::filesystem::path Beside(const wchar_t* extension) const;
};

struct TestFolder {
  // Of the macros in the folder whose extension tells their language; or of one macro, if `given` is one.
  explicit TestFolder(const std::filesystem::path& given);

  std::vector<MacroTest> tests;  // by language, by name, by case
  std::vector<std::filesystem::path>
      orphans;  // the texts of no macro; not looked for with one macro
};

// The same for all spellings of a file's name.
std::wstring Folded(const std::filesystem::path& path);
