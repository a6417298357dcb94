// SPDX-License-Identifier: MIT
#include "host/ScriptModule.h"

#include <cstdio>
#include <cwchar>
#include <fstream>

#include "platform/Encoding.h"
#include "platform/ExitCode.h"
#include "xLib/ScriptInfoRecord.h"
#include "xLib/xTexts.h"

namespace fs = std::filesystem;

namespace {

constexpr wchar_t kModuleName[] = L"scriptruby.dll";

// Private folders are named by the process's id and a number.
constexpr wchar_t kFolderName[] = L"macrorun-%lu-%lu";

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
  // A copy that is read-only like its model could not be removed.
  SetFileAttributesW(to.c_str(), FILE_ATTRIBUTE_NORMAL);
}

void WriteDescription(const fs::path& file, const std::string& engine) {
  std::ofstream(file, std::ios::binary) << "[Options]\r\nLanguage=" << engine << "\r\n";
}

bool ProcessExists(DWORD id) {
  const HANDLE process = OpenProcess(SYNCHRONIZE, FALSE, id);
  if (!process) return GetLastError() != ERROR_INVALID_PARAMETER;
  const bool running = WaitForSingleObject(process, 0) == WAIT_TIMEOUT;
  CloseHandle(process);
  return running;
}

// Removes a private folder by the names of what it holds and never recursively: what else stands in
// a folder of such a name, or behind a link, is not this program's.
void RemoveFolder(const fs::path& folder, std::error_code& error) {
  for (const fs::path& name : {fs::path(kModuleName), fs::path(kDescriptionFileName)})
    if (fs::remove(folder / name, error); error) return;
  fs::remove(folder, error);
}

// Removes the folders of processes that were killed.
void RemoveAbandoned(const fs::path& parent) {
  std::error_code error;
  for (fs::directory_iterator entry(parent, error), end; !error && entry != end;
       entry.increment(error)) {
    const std::wstring name = entry->path().filename().wstring();
    DWORD owner = 0, number = 0;
    wchar_t rest = 0;
    if (swscanf(name.c_str(), L"macrorun-%lu-%lu%lc", &owner, &number, &rest) != 2) continue;
    const DWORD attributes = GetFileAttributesW(entry->path().c_str());
    if (attributes == INVALID_FILE_ATTRIBUTES || attributes & FILE_ATTRIBUTE_REPARSE_POINT)
      continue;
    std::error_code ignored;
    if (!ProcessExists(owner)) RemoveFolder(entry->path(), ignored);
  }
}

fs::path RequireAnsiNamed(const fs::path& path) {
  const std::optional<fs::path> named = AnsiNamed(path);
  if (!named)
    throw UsageError("the system's code page cannot name " + ToUtf8(path) +
                     ", and it has no short name");
  return *named;
}

}  // namespace

PrivateFolder::PrivateFolder() {
  std::error_code error;
  const fs::path parent = fs::temp_directory_path(error);
  RemoveAbandoned(parent);
  for (DWORD i = 0; i < 100 && !error; ++i) {
    wchar_t name[40];
    std::swprintf(name, std::size(name), kFolderName, GetCurrentProcessId(), GetTickCount() + i);
    const fs::path candidate = parent / name;
    if (!fs::create_directory(candidate, error)) continue;
    path = candidate;
    return;
  }
  throw UsageError("cannot make a folder in the temporary folder " + ToUtf8(parent) + ": " +
                   error.message());
}

PrivateFolder::~PrivateFolder() {
  try {
    std::error_code error;
    RemoveFolder(path, error);
    if (error)
      std::fprintf(stderr, "macrorun: the temporary folder %s is left behind: %s\n",
                   ToUtf8(path).c_str(), error.message().c_str());
  } catch (...) {
    std::fputs("macrorun: no memory to remove the temporary folder; a later run does\n", stderr);
  }
}

ScriptModule::ScriptModule(const fs::path& file, const Language* language) {
  std::error_code error;
  if (!fs::is_regular_file(file, error))
    throw UsageError("no module at " + ToUtf8(file) + " (--module)");
  const fs::path loaded = language ? CopyPrivately(file, *language) : fs::absolute(file);
  library = LoadLibraryExW(loaded.c_str(), nullptr, LOAD_WITH_ALTERED_SEARCH_PATH);
  if (!library)
    throw UsageError("cannot load the module " + ToUtf8(file) + ": " +
                     SystemMessage(GetLastError()));
  for (const char* name : {"execute", "kill", "version"}) {
    if (Export(name)) continue;
    FreeLibrary(library);
    throw UsageError(ToUtf8(file) + " is no scripting module: it does not export " + name);
  }
}

fs::path ScriptModule::CopyPrivately(const fs::path& file, const Language& language) {
  folder.emplace();
  Copy(file, folder->Path() / kModuleName);
  const fs::path description = folder->Path() / kDescriptionFileName;
  if (language.description.empty())
    WriteDescription(description, language.engine);
  else
    Copy(language.description, description);
  // The module asks for its own folder in the ANSI code page.
  return RequireAnsiNamed(folder->Path()) / kModuleName;
}

// Also after a stop or a fault, which leave a script engine behind that points into the module: it
// makes no call of its own, and the process ends next.
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

// The module's name for a language begins with the engine's, which has two.
bool ScriptModule::RunsRuby() {
  const std::string description = Description();
  return description.starts_with("RubyScript ") || description.starts_with("Tarn.RubyScript ");
}
