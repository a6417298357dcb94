// SPDX-License-Identifier: MIT
#include "ScriptModule.h"

#include <atomic>
#include <cstdio>
#include <cwchar>
#include <string_view>

#include "Encoding.h"
#include "ExitCode.h"
#include "xLib/ScriptInfoRecord.h"

namespace fs = std::filesystem;

namespace {

constexpr wchar_t kModuleName[] = L"scriptruby.dll";
// The name under which the module looks for its language description.
constexpr wchar_t kDescriptionName[] = L"xMacroWSH.qwsh";

// Private folders are named by this, the process's id and a number.
constexpr std::wstring_view kFolderPrefix = L"macrorun-";

using ExecuteFunction = i32(__stdcall*)(const char* file, void* host);
using KillFunction = bool(__stdcall*)(i32 value);
using VersionFunction = bool(__stdcall*)(ScriptInfoRecord* record, const char* hostPath);

template <class Function>
Function As(FARPROC address) {
  return reinterpret_cast<Function>(reinterpret_cast<void*>(address));
}

// For the console's own thread, on which Ctrl+C arrives; null outside a run.
std::atomic<KillFunction> killRun = nullptr;

BOOL WINAPI OnConsoleEvent(DWORD event) {
  if (event != CTRL_C_EVENT && event != CTRL_BREAK_EVENT) return FALSE;
  const KillFunction kill = killRun.exchange(nullptr);
  if (!kill || !kill(1)) TerminateProcess(GetCurrentProcess(), kStopped);
  return TRUE;
}

void Copy(const fs::path& from, const fs::path& to) {
  std::error_code error;
  fs::copy_file(from, to, error);
  if (error) throw UsageError("cannot copy " + ToUtf8(from) + ": " + error.message());
  // A copy that is read-only like its model could not be removed.
  SetFileAttributesW(to.c_str(), FILE_ATTRIBUTE_NORMAL);
}

bool ProcessExists(DWORD id) {
  const HANDLE process = OpenProcess(SYNCHRONIZE, FALSE, id);
  if (!process) return GetLastError() != ERROR_INVALID_PARAMETER;
  const bool running = WaitForSingleObject(process, 0) == WAIT_TIMEOUT;
  CloseHandle(process);
  return running;
}

// Removes the folders of processes that were killed.
void RemoveAbandoned(const fs::path& parent) {
  std::error_code error;
  for (fs::directory_iterator entry(parent, error), end; !error && entry != end;
       entry.increment(error)) {
    const std::wstring name = entry->path().filename().wstring();
    if (!name.starts_with(kFolderPrefix)) continue;
    const DWORD owner = wcstoul(name.c_str() + kFolderPrefix.size(), nullptr, 10);
    std::error_code ignored;
    if (owner != 0 && !ProcessExists(owner)) fs::remove_all(entry->path(), ignored);
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
  const std::wstring stem =
      std::wstring(kFolderPrefix) + std::to_wstring(GetCurrentProcessId()) + L"-";
  for (DWORD i = 0; i < 100 && !error; ++i) {
    const fs::path candidate = parent / (stem + std::to_wstring(GetTickCount() + i));
    if (!fs::create_directory(candidate, error)) continue;
    path = candidate;
    return;
  }
  throw UsageError("cannot make a folder in the temporary folder " + ToUtf8(parent) + ": " +
                   error.message());
}

PrivateFolder::~PrivateFolder() {
  std::error_code error;
  fs::remove_all(path, error);
  if (error)
    std::fprintf(stderr, "macrorun: the temporary folder %s is left behind: %s\n",
                 ToUtf8(path).c_str(), error.message().c_str());
}

ScriptModule::ScriptModule(const fs::path& file, const fs::path& description) {
  std::error_code error;
  if (!fs::is_regular_file(file, error))
    throw UsageError("no module at " + ToUtf8(file) + " (--module)");
  const fs::path loaded =
      description.empty() ? fs::absolute(file) : CopyPrivately(file, description);
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

fs::path ScriptModule::CopyPrivately(const fs::path& file, const fs::path& description) {
  folder.emplace();
  Copy(file, folder->Path() / kModuleName);
  Copy(description, folder->Path() / kDescriptionName);
  // The module asks for its own folder in the ANSI code page.
  return RequireAnsiNamed(folder->Path()) / kModuleName;
}

ScriptModule::~ScriptModule() {
  FreeLibrary(library);
}

FARPROC ScriptModule::Export(const char* name) const {
  return GetProcAddress(library, name);
}

int ScriptModule::Execute(const fs::path& macro, void* host) {
  const std::string file = ToAnsi(RequireAnsiNamed(fs::absolute(macro)));
  killRun = As<KillFunction>(Export("kill"));
  SetConsoleCtrlHandler(OnConsoleEvent, TRUE);
  const int result = As<ExecuteFunction>(Export("execute"))(file.c_str(), host);
  SetConsoleCtrlHandler(OnConsoleEvent, FALSE);
  killRun = nullptr;
  return result;
}

std::string ScriptModule::Description() {
  ScriptInfoRecord record{};
  record.size = sizeof record;
  record.layoutVersion = kScriptInfoRecordVersion;
  if (!As<VersionFunction>(Export("version"))(&record, "")) return {};
  return record.description;
}
