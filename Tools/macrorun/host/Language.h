// SPDX-License-Identifier: MIT
// Which script engine runs a macro, and the description file that tells the module so.
//
// Errors: UsageError, which says what to name instead.
// Threading: any thread.
#pragma once

#include <filesystem>
#include <string>
#include <string_view>

struct LanguageOptions {
  std::string engine;                 // ProgID; empty: not given
  std::filesystem::path description;  // empty: not given
};

// Whether a ProgID names the Ruby engine.
bool IsRubyEngine(std::string_view engine);

struct Language {
  bool IsRuby() const { return IsRubyEngine(engine); }

  std::filesystem::path description;  // empty: one that names the engine only
  std::string engine;                 // ProgID
};

// In this order: --engine, --description, the macro's extension (.rbs is Ruby, any other has a
// description of its name in the program's folder `languages`).
Language ChooseLanguage(const LanguageOptions& options, const std::filesystem::path& macro);

// Whether the macro's extension tells the language, in the third of these ways.
bool HasLanguage(const std::filesystem::path& macro);
