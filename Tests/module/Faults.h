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

// As a host may that lets divisions by zero fault: the fault comes with the next instruction.
inline void DivideReals() {
  unsigned short control;
  __asm__ volatile("fnstcw %0" : "=m"(control));
  const unsigned short unmasked = static_cast<unsigned short>(control & ~4);
  __asm__ volatile("fldcw %0\n fld1\n fldz\n fdivrp\n fstp %%st\n fwait" ::"m"(unmasked));
}

inline constexpr std::array<std::pair<const char*, void (*)()>, 10> kFaults = {{
    {"read", [] { sink = *reinterpret_cast<volatile int*>(8); }},
    {"write", WriteNothing},
    {"data executed", [] { reinterpret_cast<void (*)()>(reinterpret_cast<void*>(data))(); }},
    {"division", [] { __asm__ volatile("idivl %0" ::"r"(0), "a"(1), "d"(0)); }},
    {"illegal instruction", [] { __asm__ volatile("ud2"); }},
    {"exception", [] { RaiseException(0xE06D7363, EXCEPTION_NONCONTINUABLE, 0, nullptr); }},
    {"guard page", [] { RaiseException(EXCEPTION_GUARD_PAGE, 0, 0, nullptr); }},
    {"debugger's code", [] { RaiseException(0x40010005, 0, 0, nullptr); }},
    {"division of reals", DivideReals},
    {"stack overflow", OverflowStack},
}};
