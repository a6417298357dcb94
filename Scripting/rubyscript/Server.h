// SPDX-License-Identifier: MIT
// The engine's DLL as an in-process COM server: its class, its module handle, and the count that
// keeps it loaded. The entry points themselves are declared by the system's headers.
//
// Ownership: whoever takes a server reference gives it back; each script engine, each reference to
// the class object and each lock of the server is one.
// Errors: the entry points answer HRESULTs.
// Threading: any thread.
//
// Next on the reader's path: ClassFactory.h.
#pragma once

#include <windows.h>
// Needs windows.h before it.
#include <guiddef.h>

// The class of the script engine, as an identifier and as the registry spells it.
inline constexpr CLSID kScriptEngineClass = {
    0x5C0B6E2C, 0x4F0D, 0x4B6B, {0x9E, 0x0F, 0x7B, 0x1C, 0x3A, 0x9D, 0x52, 0xE4}};
#define SCRIPT_ENGINE_CLASS L"{5C0B6E2C-4F0D-4B6B-9E0F-7B1C3A9D52E4}"

HMODULE ServerModule();

void AddServerReference();
void ReleaseServerReference();
