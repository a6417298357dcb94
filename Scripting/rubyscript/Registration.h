// SPDX-License-Identifier: MIT
// The engine's entries in the registry: its class, its two ProgIDs, and the ProgID "RubyScript" if
// no other engine holds that name. They are written for the current user only, below
// HKEY_CURRENT_USER\Software\Classes.
//
// Wine 8 knows no classes of a user: there the entries have to be copied to
// HKEY_LOCAL_MACHINE\Software\Classes, which belongs to the prefix. Windows ignores a user's classes
// in a process with an administrator's rights.
//
// A name is held by an engine when it names a class, for the user or for the machine, that has a
// server. A name whose class is gone is free to take.
//
// Ownership: only the engine's own keys and values are written and removed; a key that holds
// anything else stays. A ProgID is removed only while it names the engine's class.
// Errors: HRESULTs of the system's error codes.
// Threading: any thread; not two at once.
#pragma once

#include <windows.h>

// Writes the entries, over those of an earlier registration. On failure the registry is as before.
HRESULT RegisterEngine(HMODULE module);

// Removes what is there of the entries; S_OK when nothing is. Removes what it can and answers the
// first failure.
HRESULT UnregisterEngine();
