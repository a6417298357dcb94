// SPDX-License-Identifier: MIT
#include "cLib/cMemory.h"

#include <stdlib.h>
#include <string.h>

void* AllocateBlock(u32 bytes) { return bytes == kLargestSize ? nullptr : malloc(bytes); }

void* AllocateZeroedBlock(u32 bytes) {
  void* block = AllocateBlock(bytes);
  if (block) memset(block, 0, bytes);
  return block;
}

void ReleaseBlock(void* block) { free(block); }

#if CORE_MICROSOFT_ABI
void* __cdecl operator new(size_t bytes) noexcept { return AllocateBlock(bytes); }
void __cdecl operator delete(void* block) noexcept { ReleaseBlock(block); }
void __cdecl operator delete(void* block, size_t) noexcept { ReleaseBlock(block); }
#endif
