// SPDX-License-Identifier: MIT
// The module that ships, as a host has it: a copy of the DLL in a folder of its own with the
// description of a language beside it, and a host whose functions do nothing but keep time.
#pragma once

#include <windows.h>

#include <filesystem>
#include <string>

#include "BareObject.h"
#include "RawHost.h"

// Where this program lies, beside what it measures.
std::filesystem::path ProgramFolder();

// Writes a file as it is; throws when that fails.
void WriteFile(const std::filesystem::path& path, const std::string& bytes);

// As the host of the module's tests, but a call of a function costs as good as nothing.
class QuietHost : public RawHost {
 public:
  QuietHost();

  LoopClock clock;
  Comparison* comparisons = nullptr;  // take's, by its index
};

class Module {
 public:
  // `description` is the text of the description file; without one there is no file. What it throws
  // tells which file is missing.
  explicit Module(const std::string& description);
  ~Module();
  Module(const Module&) = delete;
  Module& operator=(const Module&) = delete;

  const std::filesystem::path& Folder() const { return folder; }
  std::filesystem::path DescriptionFile() const { return folder / "xMacroWSH.qwsh"; }
  // A macro file in the module's folder.
  std::string Macro(const std::string& name, const std::string& text);

  // One run for the quiet host: its seconds, negative and told on standard error when it failed.
  double TimeRun(const std::string& macro);
  // `version` with a record of its own; the same.
  double TimeVersion();

  QuietHost host;

 private:
  using Execute = int(__stdcall*)(const char* file, RawHost* host);
  using Version = bool(__stdcall*)(void* record, const char* hostPath);

  const std::filesystem::path folder;
  HMODULE dll;
  Execute execute;
  Version version;
};

// The description of JScript that ships with macrorun, and the shortest one.
std::string JScriptDescription();
inline constexpr char kShortDescription[] = "[Options]\r\nLanguage=JScript\r\n";
