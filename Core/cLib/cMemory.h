// SPDX-License-Identifier: MIT
// The one place through which the Core library takes memory: blocks of the C heap. A host whose lists
// the module grows makes their slots with the same C runtime's malloc (msvcrt.dll).
//
// Threading: as the C heap, any thread.
#pragma once

#include <stddef.h>

#include "cLib/cTypes.h"

// `bytes` uninitialised bytes, owned by the caller; null when there is no memory or `bytes` is
// kLargestSize (a sum of sizes that did not fit).
void* AllocateBlock(u32 bytes);

// As AllocateBlock, all bytes zero.
void* AllocateZeroedBlock(u32 bytes);

// Gives a block back; null is allowed.
void ReleaseBlock(void* block);

#if CORE_MICROSOFT_ABI
// The module has no C++ library: `new` also takes its memory here, and returns null on failure.
// cmake/MicrosoftAbi.cmake has the compiler check for null before it runs the constructor.
void* __cdecl operator new(size_t bytes) noexcept;
void __cdecl operator delete(void* block) noexcept;
void __cdecl operator delete(void* block, size_t bytes) noexcept;
#endif
