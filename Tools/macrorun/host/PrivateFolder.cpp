// SPDX-License-Identifier: MIT
#include "host/PrivateFolder.h"

#include <windows.h>

#include <cstdio>
#include <cwchar>

#include "platform/Encoding.h"
#include "platform/ExitCode.h"
#include "xLib/xTexts.h"

namespace fs = std::filesystem;

namespace {

// The process's id, and a number.
constexpr wchar_t kFolderName[] = L"macrorun-%lu-%lu";

bool ProcessExists(DWORD id) {
  const HANDLE process = OpenProcess(SYNCHRONIZE, FALSE, id);
  if (!process) return GetLastError() != ERROR_INVALID_PARAMETER;
  const bool running = WaitForSingleObject(process, 0) == WAIT_TIMEOUT;
  CloseHandle(process);
  return running;
}

// Removes a private folder by the names of what it holds and never recursively: anything else in
// a folder of that name, or in the target of a link, does not belong to this program.
void RemoveFolder(const fs::path& folder, std::error_code& error) {
  for (const fs::path& name :
       {fs::path(PrivateFolder::kModuleName), fs::path(kDescriptionFileName)})
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
  throw UsageError("cannot create a folder in the temporary folder " + ToUtf8(parent) + ": " +
                   error.message());
}

PrivateFolder::~PrivateFolder() {
  try {
    std::error_code error;
    RemoveFolder(path, error);
    if (error)
      std::fprintf(stderr, "macrorun: cannot remove the temporary folder %s: %s\n",
                   ToUtf8(path).c_str(), error.message().c_str());
  } catch (...) {
    std::fputs("macrorun: out of memory; the next run removes the temporary folder\n", stderr);
  }
}

fs::path PrivateFolder::Description() const { return path / kDescriptionFileName; }
