// SPDX-License-Identifier: MIT
// The loaded scripting module.
//
// The module reads its language description from its own folder. To give it another one, its file
// and the description are copied into a private temporary folder and loaded from there; the folder
// goes when the object does. A process that is killed leaves its folder to the next run.
//
// Threading: one thread; Ctrl+C arrives on a thread of the console's, which calls only `kill`.
#pragma once

#include <windows.h>

#include <filesystem>
#include <optional>
#include <string>

// A folder under the user's temporary folder, removed with the two files that it may hold.
class PrivateFolder {
 public:
  PrivateFolder();  // throws UsageError
  ~PrivateFolder();
  PrivateFolder(const PrivateFolder&) = delete;
  PrivateFolder& operator=(const PrivateFolder&) = delete;

  const std::filesystem::path& Path() const { return path; }

 private:
  std::filesystem::path path;
};

class ScriptModule {
 public:
  // Loads `file`, with `description` unless that is empty. Throws UsageError.
  ScriptModule(const std::filesystem::path& file, const std::filesystem::path& description);
  ~ScriptModule();
  ScriptModule(const ScriptModule&) = delete;
  ScriptModule& operator=(const ScriptModule&) = delete;

  // Runs a macro with `host`, an object of the host macro interface, and returns what `execute`
  // does. Meanwhile the first Ctrl+C asks the host to stop the macro; a second ends the program.
  // Throws UsageError when the system's code page cannot name the file.
  int Execute(const std::filesystem::path& macro, void* host);

  // The name of the module's language; empty when the module refuses to tell.
  std::string Description();
  bool RunsRuby();

 private:
  std::filesystem::path CopyPrivately(const std::filesystem::path& file,
                                      const std::filesystem::path& description);
  FARPROC Export(const char* name) const;

  std::optional<PrivateFolder> folder;  // outlives the library
  HMODULE library = nullptr;
};
