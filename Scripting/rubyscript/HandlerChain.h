// SPDX-License-Identifier: MIT
// The thread's chain of structured exception handlers, as 32-bit x86 Windows defines it. The chain
// starts in the thread's information block; each record lives in a frame of the stack. Structured
// exceptions and the C library's longjmp unwind the same chain.
//
// Threading: a record belongs to the thread and the stack it was made on.
#pragma once

#include <stdint.h>
#include <windows.h>

// As the system defines it.
struct HandlerRecord {
  HandlerRecord* next;
  EXCEPTION_DISPOSITION(__cdecl* handle)(EXCEPTION_RECORD* record, void* frame, CONTEXT* context,
                                         void* dispatcher);
};

inline void* ChainHead() { return reinterpret_cast<void*>(__readfsdword(0)); }
inline void SetChainHead(void* record) { __writefsdword(0, reinterpret_cast<DWORD>(record)); }
inline void* EmptyChain() { return reinterpret_cast<void*>(UINT32_MAX); }

// Set in the flags of an exception while frames are being unwound.
constexpr DWORD kUnwindingFlags = EXCEPTION_UNWINDING | EXCEPTION_EXIT_UNWIND;
