// SPDX-License-Identifier: MIT
// The loaded scripting module.
//
// The module reads its language description from its own folder, or else from the user's. To give it
// another one, its file and the description are copied into a private temporary folder and loaded
// from there.
//
// Errors: UsageError. Threading: one thread, but Kill may come from any.
#pragma once

#include <windows.h>

#include <filesystem>
#include <optional>
#include <string>

#include "host/Language.h"
#include "host/PrivateFolder.h"

struct ScriptInfoRecord;

class ScriptModule {
 public:
  // Loads `file` for the language; null: with the description that it finds.
  ScriptModule(const std::filesystem::path& file, const Language* language);
  ~ScriptModule();
  ScriptModule(const ScriptModule&) = delete;
  ScriptModule& operator=(const ScriptModule&) = delete;

  // The macro's name as `execute` and the module's reports have it. Throws UsageError when the
  // system's code page has no name for it.
  static std::string NameOf(const std::filesystem::path& macro);

  // Runs a macro, by that name, with `host`, an object of the host macro interface; answers what
  // `execute` does.
  int Execute(const std::string& macro, void* host);
  // Asks the host of the run to stop it; false outside a run.
  bool Kill();

  // What the module tells of its language; false when it refuses.
  bool FillRecord(ScriptInfoRecord& record);
  // The name of the module's language; empty when the module refuses to tell.
  std::string Description();

 private:
  std::filesystem::path CopyPrivately(const std::filesystem::path& file, const Language& language);
  FARPROC Export(const char* name) const;

  std::optional<PrivateFolder> folder;  // outlives the library
  HMODULE library = nullptr;
};
