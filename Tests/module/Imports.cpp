// SPDX-License-Identifier: MIT
#include "Imports.h"

#include <oleauto.h>
#include <stdlib.h>

#include <atomic>
#include <cstring>

namespace {
// The Ruby engine also runs threads.
std::atomic<int> requestsLeft = 0;
std::atomic<bool> requestFailed = false;
std::atomic<int> live = 0;

bool Fails() {
  if (requestsLeft == 0 || --requestsLeft > 0) return false;
  return requestFailed = true;
}

void* Took(void* block) {
  live += block != nullptr;
  return block;
}
void* Gave(void* block) {
  live -= block != nullptr;
  return block;
}

// A new block is full of something, so that no code can rely on zeros.
void* Filled(void* block, size_t bytes) { return Took(block ? memset(block, 0xCD, bytes) : block); }

void* Malloc(size_t bytes) { return Fails() ? nullptr : Filled(malloc(bytes), bytes); }
void* Calloc(size_t count, size_t bytes) { return Fails() ? nullptr : Took(calloc(count, bytes)); }
void* Realloc(void* block, size_t bytes) {
  if (Fails()) return nullptr;
  return Took(realloc(Gave(block), bytes));
}
void Free(void* block) { free(Gave(block)); }

LPVOID WINAPI TaskAlloc(SIZE_T bytes) {
  return Fails() ? nullptr : Filled(CoTaskMemAlloc(bytes), bytes);
}
void WINAPI TaskFree(LPVOID block) { CoTaskMemFree(Gave(block)); }

BSTR WINAPI AllocString(const OLECHAR* text) { return Fails() ? nullptr : SysAllocString(text); }
void WINAPI FreeString(BSTR text) {
  textsFreed += text != nullptr;
  SysFreeString(text);
}
BSTR WINAPI AllocStringLen(const OLECHAR* text, UINT size) {
  return Fails() ? nullptr : SysAllocStringLen(text, size);
}
HRESULT WINAPI ChangeType(VARIANT* to, VARIANT* from, USHORT flags, VARTYPE type) {
  return Fails() ? E_OUTOFMEMORY : VariantChangeType(to, from, flags, type);
}

char* CopyText(const char* text) {
  return Fails() ? nullptr : static_cast<char*>(Took(_strdup(text)));
}
SAFEARRAY* WINAPI CreateVector(VARTYPE type, LONG lowest, ULONG count) {
  return Fails() ? nullptr : SafeArrayCreateVector(type, lowest, count);
}
HRESULT WINAPI NewErrorInfo(ICreateErrorInfo** info) {
  return Fails() ? E_OUTOFMEMORY : CreateErrorInfo(info);
}
LPWCH WINAPI Environment() { return Fails() ? nullptr : GetEnvironmentStringsW(); }

// The table of pointers that the loader has filled, by the description of each imported file.
template <class T>
T* Inside(HMODULE module, DWORD offset) {
  return reinterpret_cast<T*>(reinterpret_cast<char*>(module) + offset);
}
}  // namespace

void* ReplaceImport(HMODULE module, const char* function, void* replacement) {
  const auto* dos = Inside<IMAGE_DOS_HEADER>(module, 0);
  const auto* headers = Inside<IMAGE_NT_HEADERS>(module, dos->e_lfanew);
  const auto& directory = headers->OptionalHeader.DataDirectory[IMAGE_DIRECTORY_ENTRY_IMPORT];
  for (auto* file = Inside<IMAGE_IMPORT_DESCRIPTOR>(module, directory.VirtualAddress); file->Name;
       ++file) {
    const auto* names = Inside<IMAGE_THUNK_DATA>(module, file->OriginalFirstThunk);
    auto* slot = Inside<void*>(module, file->FirstThunk);
    for (; names->u1.AddressOfData; ++names, ++slot) {
      if (IMAGE_SNAP_BY_ORDINAL(names->u1.Ordinal)) continue;
      const auto* name = Inside<IMAGE_IMPORT_BY_NAME>(module, names->u1.AddressOfData);
      if (strcmp(name->Name, function) != 0) continue;
      DWORD protection;
      VirtualProtect(slot, sizeof *slot, PAGE_READWRITE, &protection);
      void* const previous = *slot;
      *slot = replacement;
      VirtualProtect(slot, sizeof *slot, protection, &protection);
      return previous;
    }
  }
  return nullptr;
}

void WatchMemory(HMODULE module) {
  const auto replace = [module](const char* name, auto* function) {
    ReplaceImport(module, name, reinterpret_cast<void*>(function));
  };
  replace("malloc", Malloc), replace("calloc", Calloc), replace("realloc", Realloc);
  replace("free", Free);
  replace("CoTaskMemAlloc", TaskAlloc), replace("CoTaskMemFree", TaskFree);
  replace("SysAllocString", AllocString), replace("SysAllocStringLen", AllocStringLen);
  replace("SysFreeString", FreeString);
  replace("VariantChangeType", ChangeType), replace("SafeArrayCreateVector", CreateVector);
  replace("CreateErrorInfo", NewErrorInfo), replace("_strdup", CopyText);
  replace("GetEnvironmentStringsW", Environment);
}

bool FailRequest(int n) {
  requestsLeft = n;
  return requestFailed.exchange(false);
}

int LiveBlocks() { return live; }
