// SPDX-License-Identifier: MIT
// The functions that a loaded module has from others, and its memory by way of them: the file that
// ships is tested, not a build of its own.
#pragma once

#include <windows.h>

// Puts `replacement` in the place of the named function that `module` imports. Returns the function
// that was there, null when the module does not import it by that name.
void* ReplaceImport(HMODULE module, const char* function, void* replacement);

// Watches the memory of one module at a time: blocks of the C heap and of COM, and what others make
// for it (COM's texts, arrays, conversions and error objects, copies of the environment). The imports
// stay replaced.
void WatchMemory(HMODULE module);

// The n-th request from now fails (1: the next one; 0: none does). Returns whether the one of the
// last call has failed.
bool FailRequest(int n);

// How many blocks more the module has taken than given back since it is watched. What others make for
// it does not count: others free it.
int LiveBlocks();
