// SPDX-License-Identifier: MIT
// The shipped module as a host uses it: a copy of the DLL in a separate folder with a language
// description beside it, and a host whose functions only measure time.
#pragma once

#include <windows.h>

#include <filesystem>
#include <string>

#include "BareObject.h"
#include "RawHost.h"

// The folder of this program and of the programs that it measures.
std::filesystem::path ProgramFolder();

// Writes the bytes to a file; throws on failure.
void WriteFile(const std::filesystem::path& path, const std::string& bytes);

// Like the host of the module's tests, but a call of a function costs almost nothing.
class QuietHost : public RawHost {
 public:
  QuietHost();

  LoopClock clock;
  Comparison* comparisons = nullptr;  // of the function `take`, by its index
};

class Module {
 public:
  // `description` is the text of the description file; if it is empty, there is no file. The
  // exception names a missing file.
  explicit Module(const std::string& description);
  ~Module();
  Module(const Module&) = delete;
  Module& operator=(const Module&) = delete;

  const std::filesystem::path& Folder() const { return folder; }
  std::filesystem::path DescriptionFile() const { return folder / "xMacroWSH.qwsh"; }
  // A macro file in the module's folder.
  std::string Macro(const std::string& name, const std::string& text);

  // Seconds of one run for the quiet host; negative, with a message on standard error, on failure.
  double TimeRun(const std::string& macro);
  // Seconds of one call of `version`; negative on failure.
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
