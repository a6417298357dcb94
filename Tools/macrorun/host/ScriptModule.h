// SPDX-License-Identifier: MIT
// The loaded scripting module.
//
// The module reads the language description in its folder, or else the one in the user's folder.
// For another description, this class copies the module and the description into a private
// temporary folder and loads the module from there.
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
  // Loads `file` for the language. Null: the module uses the description that it finds.
  ScriptModule(const std::filesystem::path& file, const Language* language);
  ~ScriptModule();
  ScriptModule(const ScriptModule&) = delete;
  ScriptModule& operator=(const ScriptModule&) = delete;

  // The macro's path for `execute`; the module repeats it in its reports. Throws UsageError when
  // the system's code page cannot represent it.
  static std::string NameOf(const std::filesystem::path& macro);

  // Runs a macro by its path from NameOf. `host` is an object of the host macro interface. Returns
  // the result of `execute`.
  int Execute(const std::string& macro, void* host);
  // Asks the host of the current run to stop it; false outside of a run.
  bool Kill();

  // Fills the record of the language; false when the module refuses.
  bool FillRecord(ScriptInfoRecord& record);
  // The name of the module's language; empty when the module refuses.
  std::string Description();

 private:
  std::filesystem::path CopyPrivately(const std::filesystem::path& file, const Language& language);
  FARPROC Export(const char* name) const;

  std::optional<PrivateFolder> folder;  // destroyed after the library
  HMODULE library = nullptr;
};
