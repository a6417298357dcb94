// SPDX-License-Identifier: MIT
// What the cross compiler expects of the Microsoft C runtime and mingw's does not have, or has
// under another name. With the Microsoft C runtime itself this file is empty.
#include <stddef.h>  // for __MINGW64_VERSION_MAJOR

#ifdef __MINGW64_VERSION_MAJOR
// Marks objects that use floating point; only its presence counts.
extern "C" {
extern int _fltused;
int _fltused = 1;
}

// Touches each page of a large stack frame and makes room for it (the size is in eax): mingw's
// function of the same contract.
__asm__(
    ".globl __chkstk\n"
    "__chkstk:\n"
    "  jmp ___chkstk\n");
#endif
