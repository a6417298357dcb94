// SPDX-License-Identifier: MIT
#include "host/ScriptModule.h"

#include <fstream>

#include "platform/Encoding.h"
#include "platform/ExitCode.h"
#include "xLib/ScriptInfoRecord.h"
#include "xLib/xTexts.h"

namespace fs = std::filesystem;

namespace {

using ExecuteFunction = i32(__stdcall*)(const char* file, void* host);
using KillFunction = bool(__stdcall*)(i32 value);
using VersionFunction = bool(__stdcall*)(ScriptInfoRecord* record, const char* hostPath);

template <class Function>
Function As(FARPROC address) {
  return reinterpret_cast<Function>(reinterpret_cast<void (*)()>(address));
}

void Copy(const fs::path& from, const fs::path& to) {
  std::error_code error;
  fs::copy_file(from, to, error);
  if (error) throw UsageError("cannot copy " + ToUtf8(from) + ": " + error.message());
  // A read-only copy could not be removed.
  SetFileAttributesW(to.c_str(), FILE_ATTRIBUTE_NORMAL);
}

void WriteDescription(const fs::path& file, const std::string& engine) {
  std::ofstream(file, std::ios::binary) << "[Options]\r\nLanguage=" << engine << "\r\n";
}

fs::path RequireAnsiNamed(const fs::path& path) {
  const std::optional<fs::path> named = AnsiNamed(path);
  if (!named)
    throw UsageError("the system's code page cannot represent " + ToUtf8(path) +
                     ", and it has no short name; rename it");
  return *named;
}

}  // namespace

ScriptModule::ScriptModule(const fs::path& file, const Language* language) {
  std::error_code error;
  if (!fs::is_regular_file(file, error))
    throw UsageError("no module at " + ToUtf8(file) + " (name it with --module)");
  const fs::path loaded = language ? CopyPrivately(file, *language) : fs::absolute(file);
  library = LoadLibraryExW(loaded.c_str(), nullptr, LOAD_WITH_ALTERED_SEARCH_PATH);
  if (!library)
    throw UsageError("cannot load the module " + ToUtf8(file) + ": " +
                     SystemMessage(GetLastError()));
  for (const char* name : {"execute", "kill", "version"}) {
    if (Export(name)) continue;
    FreeLibrary(library);
    throw UsageError(ToUtf8(file) + " is not a scripting module: it does not export " + name);
  }
}

fs::path ScriptModule::CopyPrivately(const fs::path& file, const Language& language) {
  folder.emplace();
  Copy(file, folder->Module());
  if (language.description.empty())
    WriteDescription(folder->Description(), language.engine);
  else
    Copy(language.description, folder->Description());
  // The module asks for its own folder in the ANSI code page.
  return RequireAnsiNamed(folder->Path()) / PrivateFolder::kModuleName;
}

// After a stop or a fault, a script engine that points into the module still exists. It makes no
// calls, and the process ends next.
ScriptModule::~ScriptModule() { FreeLibrary(library); }

FARPROC ScriptModule::Export(const char* name) const { return GetProcAddress(library, name); }

std::string ScriptModule::NameOf(const fs::path& macro) {
  return ToAnsi(RequireAnsiNamed(fs::absolute(macro)));
}

int ScriptModule::Execute(const std::string& macro, void* host) {
  return As<ExecuteFunction>(Export("execute"))(macro.c_str(), host);
}

bool ScriptModule::Kill() { return As<KillFunction>(Export("kill"))(1); }

bool ScriptModule::FillRecord(ScriptInfoRecord& record) {
  record = {};
  record.size = sizeof record;
  record.layoutVersion = kScriptInfoRecordVersion;
  return As<VersionFunction>(Export("version"))(&record, "");
}

std::string ScriptModule::Description() {
  ScriptInfoRecord record;
  return FillRecord(record) ? record.description : "";
}
