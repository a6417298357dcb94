// SPDX-License-Identifier: MIT
// The handle of the loaded module, whose string resources the Core library reads. Kept once, when
// the module is attached to its process; null until then.
#pragma once

void KeepModuleHandle(void* handle);  // an HMODULE
void* ModuleHandle();
