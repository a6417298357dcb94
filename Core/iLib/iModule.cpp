// SPDX-License-Identifier: MIT
#include "iLib/iModule.h"

static void* moduleHandle = nullptr;

void KeepModuleHandle(void* handle) { moduleHandle = handle; }

void* ModuleHandle() { return moduleHandle; }
