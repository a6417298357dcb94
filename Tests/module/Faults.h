// SPDX-License-Identifier: MIT
// Structured exceptions of every kind that a host or an engine can raise.
#pragma once

#include <windows.h>

#include <array>
#include <utility>

inline volatile int sink;
inline unsigned char data[16] = {0xC3};  // the processor's "return"

inline void WriteNothing() { *reinterpret_cast<volatile int*>(8) = 1; }
__attribute__((noinline)) inline void OverflowStack() {
  volatile char page[4096] = {1};
  if (page[0] == 1) OverflowStack();
  sink = page[0];
}

inline constexpr std::array<std::pair<const char*, void (*)()>, 7> kFaults = {{
    {"read", [] { sink = *reinterpret_cast<volatile int*>(8); }},
    {"write", WriteNothing},
    {"data executed", [] { reinterpret_cast<void (*)()>(reinterpret_cast<void*>(data))(); }},
    {"division", [] { __asm__ volatile("idivl %0" ::"r"(0), "a"(1), "d"(0)); }},
    {"illegal instruction", [] { __asm__ volatile("ud2"); }},
    {"exception", [] { RaiseException(0xE06D7363, EXCEPTION_NONCONTINUABLE, 0, nullptr); }},
    {"stack overflow", OverflowStack},
}};
