// SPDX-License-Identifier: MIT
#include "platform/ProgramFile.h"

#include <windows.h>

#include <string>

std::filesystem::path ProgramFile() {
  std::wstring file(32768, L'\0');
  const DWORD length = static_cast<DWORD>(file.size());
  file.resize(GetModuleFileNameW(nullptr, file.data(), length));
  return file;
}

std::filesystem::path ProgramFolder() { return ProgramFile().parent_path(); }
