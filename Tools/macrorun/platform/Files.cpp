// SPDX-License-Identifier: MIT
#include "platform/Files.h"

#include <fcntl.h>
#include <io.h>
#include <windows.h>
// shlwapi.h needs windows.h before it.
#include <shlwapi.h>

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <memory>
#include <vector>

#include "platform/Encoding.h"
#include "platform/ExitCode.h"

namespace fs = std::filesystem;

namespace {

using File = std::unique_ptr<std::FILE, int (*)(std::FILE*)>;

constexpr wchar_t kTemporarySuffix[] = L".macrorun~";

// NUL, AUX and similar names are devices in every folder.
bool IsDevice(const fs::path& path) {
  using Function = ULONG(WINAPI*)(const wchar_t*);
  void* const found = reinterpret_cast<void*>(
      GetProcAddress(GetModuleHandleW(L"ntdll.dll"), "RtlIsDosDeviceName_U"));
  return found && reinterpret_cast<Function>(found)(path.c_str()) != 0;
}

File Open(const fs::path& path, const char* what) {
  const std::string refused = std::string("cannot read the ") + what + " " + ToUtf8(path) + ": ";
  if (IsDevice(path)) throw UsageError(refused + "the name is that of a Windows device");
  std::error_code ignored;
  if (fs::is_directory(path, ignored)) throw UsageError(refused + "it is a folder");
  File file(_wfopen(path.c_str(), L"rb"), std::fclose);
  if (!file) throw UsageError(refused + std::strerror(errno));
  return file;
}

std::string ReadAll(std::FILE* file, const std::string& name) {
  std::string bytes;
  char block[16384];
  while (const std::size_t count = std::fread(block, 1, sizeof block, file))
    bytes.append(block, count);
  if (std::ferror(file)) throw UsageError("cannot read " + name);
  return bytes;
}

[[noreturn]] void FailWriting(const fs::path& path, DWORD code) {
  throw UsageError("cannot write " + ToUtf8(path) + ": " + SystemMessage(code));
}

// Wine converts an access list to a wider Unix mode than the one it came from.
bool IsWine() { return GetProcAddress(GetModuleHandleW(L"ntdll.dll"), "wine_get_version"); }

void CopyAccessList(const fs::path& from, const fs::path& to) {
  DWORD size = 0;
  GetFileSecurityW(from.c_str(), DACL_SECURITY_INFORMATION, nullptr, 0, &size);
  std::vector<unsigned char> descriptor(size);
  if (size > 0 &&
      GetFileSecurityW(from.c_str(), DACL_SECURITY_INFORMATION, descriptor.data(), size, &size))
    SetFileSecurityW(to.c_str(), DACL_SECURITY_INFORMATION, descriptor.data());
}

// A temporary file beside its target. It replaces the target, or is deleted.
class Replacement {
 public:
  explicit Replacement(const fs::path& file) : target(file), path(file) {
    path += kTemporarySuffix;
    handle = CreateFileW(path.c_str(), GENERIC_WRITE, 0, nullptr, CREATE_ALWAYS,
                         FILE_ATTRIBUTE_NORMAL, nullptr);
    if (handle == INVALID_HANDLE_VALUE) FailWriting(path, GetLastError());
  }
  ~Replacement() {
    if (handle != INVALID_HANDLE_VALUE) CloseHandle(handle);
    if (!done) DeleteFileW(path.c_str());
  }
  Replacement(const Replacement&) = delete;
  Replacement& operator=(const Replacement&) = delete;

  void Write(const std::string& bytes);
  void Commit();

 private:
  void TakeOverPermissions();

  const fs::path target;
  fs::path path;
  HANDLE handle;
  bool done = false;
};

void Replacement::Write(const std::string& bytes) {
  DWORD written = 0;
  for (std::size_t from = 0; from < bytes.size(); from += written) {
    const DWORD length = static_cast<DWORD>(std::min<std::size_t>(bytes.size() - from, 1 << 20));
    if (!WriteFile(handle, bytes.data() + from, length, &written, nullptr))
      FailWriting(target, GetLastError());
    if (written == 0) FailWriting(target, ERROR_DISK_FULL);
  }
  if (!FlushFileBuffers(handle)) FailWriting(target, GetLastError());
}

// MoveFileEx replaces in one step. ReplaceFile would first rename the old file.
void Replacement::Commit() {
  CloseHandle(handle);
  handle = INVALID_HANDLE_VALUE;
  TakeOverPermissions();
  if (!MoveFileExW(path.c_str(), target.c_str(),
                   MOVEFILE_REPLACE_EXISTING | MOVEFILE_WRITE_THROUGH))
    FailWriting(target, GetLastError());
  done = true;
}

// A failure is ignored: not every file system has permissions.
void Replacement::TakeOverPermissions() {
  const DWORD attributes = GetFileAttributesW(target.c_str());
  if (attributes == INVALID_FILE_ATTRIBUTES) return;  // there is no old file
  if (!IsWine()) CopyAccessList(target, path);
  SetFileAttributesW(path.c_str(), attributes);
}

}  // namespace

// Compares long names: the system's search would also find "a.rbs~" for "*.rbs".
std::vector<fs::path> FilesMatching(const fs::path& pattern) {
  if (pattern.filename().wstring().find_first_of(L"*?") == std::wstring::npos) return {pattern};
  const fs::path folder = pattern.parent_path();
  std::vector<fs::path> files;
  std::error_code error;
  for (fs::directory_iterator entry(folder.empty() ? "." : folder, error), end;
       !error && entry != end; entry.increment(error)) {
    const fs::path name = entry->path().filename();
    std::error_code ignored;
    if (!entry->is_directory(ignored) && PathMatchSpecW(name.c_str(), pattern.filename().c_str()))
      files.push_back(folder / name);
  }
  std::sort(files.begin(), files.end());
  return files;
}

std::string ReadInput(const fs::path& path) {
  if (path.empty()) return {};
  if (path == "-") {
    _setmode(_fileno(stdin), _O_BINARY);
    return ReadAll(stdin, "standard input");
  }
  return ReadAll(Open(path, "file").get(), ToUtf8(path));
}

void RequireReadable(const fs::path& path, const char* what) { Open(path, what); }

void RequireMacro(const fs::path& path) {
  const File file = Open(path, "macro");
  unsigned char mark[2] = {};
  if (std::fread(mark, 1, 2, file.get()) != 2) return;
  if ((mark[0] == 0xFF && mark[1] == 0xFE) || (mark[0] == 0xFE && mark[1] == 0xFF))
    throw UsageError("cannot read the macro " + ToUtf8(path) +
                     ": it is saved as UTF-16; save it as UTF-8");
}

void RequireReplaceable(const fs::path& path, bool mustExist) {
  const DWORD attributes = GetFileAttributesW(path.c_str());
  if (attributes == INVALID_FILE_ATTRIBUTES) {
    if (mustExist) RequireReadable(path, "file");
    std::error_code error;
    const fs::path folder = path.parent_path();
    if (!folder.empty() && !fs::is_directory(folder, error))
      throw UsageError("cannot write " + ToUtf8(path) + ": no such folder: " + ToUtf8(folder));
    return;
  }
  if (attributes & FILE_ATTRIBUTE_DIRECTORY)
    throw UsageError("cannot write " + ToUtf8(path) + ": it is a folder");
  if (attributes & FILE_ATTRIBUTE_READONLY)
    throw UsageError("cannot write " + ToUtf8(path) + ": it is write-protected");
}

void ReplaceFileBytes(const fs::path& path, const std::string& bytes) {
  Replacement replacement(path);
  replacement.Write(bytes);
  replacement.Commit();
}
