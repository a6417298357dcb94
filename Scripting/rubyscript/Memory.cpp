// SPDX-License-Identifier: MIT
// The engine's own allocation, in place of the C++ library's: that one would bring exceptions and
// their run-time with it. Null when there is no memory; Ruby's objects are not allocated here.
#include <stdlib.h>

#include <new>

void* operator new(size_t bytes, const std::nothrow_t&) noexcept { return malloc(bytes); }
void operator delete(void* block) noexcept { free(block); }
void operator delete(void* block, size_t) noexcept { free(block); }

// Entry in the virtual table of an abstract class; nothing can call it.
extern "C" void __cxa_pure_virtual() { __builtin_trap(); }
