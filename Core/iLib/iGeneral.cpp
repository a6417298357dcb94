// SPDX-License-Identifier: MIT
#include "iLib/iGeneral.h"

// The newer parts of the shell's headers have inline helpers that only some compilers accept.
#define _WIN32_IE 0x0600

// shlobj.h must come after windows.h.
#include <windows.h>
// clang-format off
#include <shlobj.h>
// clang-format on

#include "cLib/cMemory.h"
#include "cLib/cReport.h"
#include "iLib/iModule.h"

static constexpr int kFolderLocalAppData = 28;    // CSIDL_LOCAL_APPDATA
static constexpr DWORD kLongestModuleName = 255;  // longer names no longer join with a file name
// The line number in reports of this check. It is fixed, since readers of logs know the check by it.
static constexpr int kModuleNameReportLine = 899;

static String productFolder;

String ModuleFolder() {
  char name[512] = "";
  const DWORD length = GetModuleFileNameA(static_cast<HMODULE>(ModuleHandle()), name, 511);
  if (length == 0 || length >= kLongestModuleName)
    Report("iGeneral", kModuleNameReportLine, "Unusable module file name", kReportAssert);
  String folder(name);
  const int slash = folder.FindReverse("\\", 0, true);
  folder.Delete(slash + 1, kLargestSize);
  return folder;
}

// The token that access is checked for, to be closed by the caller; null when there is none.
static HANDLE OpenCheckToken() {
  HANDLE token = nullptr;
  if (OpenThreadToken(GetCurrentThread(), TOKEN_QUERY, TRUE, &token)) return token;
  HANDLE processToken = nullptr;
  if (!OpenProcessToken(GetCurrentProcess(), TOKEN_QUERY | TOKEN_DUPLICATE, &processToken))
    return nullptr;
  if (!DuplicateToken(processToken, SecurityImpersonation, &token)) token = nullptr;
  CloseHandle(processToken);
  return token;
}

static bool DescriptorGrants(PSECURITY_DESCRIPTOR descriptor) {
  HANDLE token = OpenCheckToken();
  if (!token) return false;
  GENERIC_MAPPING mapping = {FILE_GENERIC_READ, FILE_GENERIC_WRITE, FILE_GENERIC_EXECUTE,
                             FILE_ALL_ACCESS};
  DWORD wanted = GENERIC_READ | GENERIC_WRITE;
  MapGenericMask(&wanted, &mapping);
  PRIVILEGE_SET privileges = {};
  DWORD privilegeBytes = sizeof privileges;
  DWORD granted = 0;
  BOOL access = FALSE;
  const BOOL checked = AccessCheck(descriptor, token, wanted, &mapping, &privileges,
                                   &privilegeBytes, &granted, &access);
  CloseHandle(token);
  return checked && access;
}

bool MayReadAndWrite(const char* folder) {
  const SECURITY_INFORMATION parts =
      OWNER_SECURITY_INFORMATION | GROUP_SECURITY_INFORMATION | DACL_SECURITY_INFORMATION;
  DWORD bytes = 0;
  GetFileSecurityA(folder, parts, nullptr, 0, &bytes);
  PSECURITY_DESCRIPTOR descriptor = bytes ? AllocateBlock(bytes) : nullptr;
  if (!descriptor) return false;
  const bool granted =
      GetFileSecurityA(folder, parts, descriptor, bytes, &bytes) && DescriptorGrants(descriptor);
  ReleaseBlock(descriptor);
  return granted;
}

static bool IsFolder(const char* path) {
  const DWORD attributes = GetFileAttributesA(path);
  return attributes != INVALID_FILE_ATTRIBUTES && (attributes & FILE_ATTRIBUTE_DIRECTORY);
}

bool EnsureFolder(const char* folder) {
  if (!folder || !*folder) return false;
  if (!IsFolder(folder)) SHCreateDirectoryExA(nullptr, folder, nullptr);
  return IsFolder(folder);
}

void EndWithBackslash(String& path) {
  if (!path.EndsWith("\\", true)) path.AppendChar('\\');
}

String ProgramsFolder() {
  char localAppData[MAX_PATH] = "";
  if (!SHGetSpecialFolderPathA(nullptr, localAppData, kFolderLocalAppData, TRUE)) return String();
  String folder(localAppData);
  EndWithBackslash(folder);
  folder.Append("Programs\\");
  EnsureFolder(folder.Text());
  return folder;
}

const String& ProductFolder() {
  if (productFolder.IsEmpty()) {
    String folder = ProgramsFolder();
    if (folder.IsEmpty()) return productFolder;
    folder.Append("Tarn\\");
    EnsureFolder(folder.Text());
    productFolder.Assign(folder.Text());
  }
  return productFolder;
}
