// SPDX-License-Identifier: MIT
#include "iLib/iModule.h"

#include <windows.h>

#include "cLib/cTypes.h"

static void* moduleHandle = nullptr;

void KeepModuleHandle(void* handle) { moduleHandle = handle; }

void* ModuleHandle() { return moduleHandle; }

// The handle is the address of the image, which begins with its headers.
bool IsInModule(const void* address) {
  const char* const image = static_cast<const char*>(moduleHandle);
  if (!image) return false;
  const LONG offset = reinterpret_cast<const IMAGE_DOS_HEADER*>(image)->e_lfanew;
  const auto* const headers = reinterpret_cast<const IMAGE_NT_HEADERS*>(image + offset);
  const uintptr_t inside = reinterpret_cast<uintptr_t>(address) - reinterpret_cast<uintptr_t>(image);
  return inside < headers->OptionalHeader.SizeOfImage;
}
