// SPDX-License-Identifier: MIT
// The script engine of a macro, and the language description that the module reads.
//
// Errors: UsageError, which names the options to use.
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

  std::filesystem::path description;  // empty: write one with the engine only
  std::string engine;                 // ProgID
};

// Uses --engine, else --description, else the macro's extension: .rbs is Ruby, and .EXT is
// described by EXT.qwsh in the program's folder `languages`.
Language ChooseLanguage(const LanguageOptions& options, const std::filesystem::path& macro);

// Whether the macro's extension determines the language.
bool HasLanguage(const std::filesystem::path& macro);
