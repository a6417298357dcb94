// SPDX-License-Identifier: MIT
// Replaces functions that a loaded module imports, among them those that give it memory. So the file
// that ships is tested, not a special build.
#pragma once

#include <gtest/gtest.h>
#include <windows.h>

// Puts `replacement` in the place of the named function that `module` imports. Returns the function
// that was there, null when the module does not import it by that name.
void* ReplaceImport(HMODULE module, const char* function, void* replacement);

// Replaces an import for its lifetime.
class Replacement {
 public:
  template <class Function>
  Replacement(HMODULE module, const char* name, Function* function)
      : module(module),
        name(name),
        original(ReplaceImport(module, name, reinterpret_cast<void*>(function))) {
    EXPECT_TRUE(original) << name << " is not what the module calls";
  }
  ~Replacement() { ReplaceImport(module, name, original); }
  Replacement(const Replacement&) = delete;
  Replacement& operator=(const Replacement&) = delete;

 private:
  const HMODULE module;
  const char* const name;
  void* const original;
};

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

// COM's texts that the watched module has freed.
inline int textsFreed = 0;
