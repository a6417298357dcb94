// SPDX-License-Identifier: MIT
// The handle of the loaded module, whose file name and string resources the Core library
// reads. Kept on every load notification; null until the first.
#pragma once

void KeepModuleHandle(void* handle);  // an HMODULE
void* ModuleHandle();

// Whether `address` lies in the image of the loaded module.
bool IsInModule(const void* address);
