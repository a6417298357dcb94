// SPDX-License-Identifier: MIT
// The class object: makes script engines for COM.
//
// Ownership: one static object for the life of the DLL. References to it are server references: they
// keep the DLL, not the object. AddRef and Release therefore always answer 1.
// Errors: HRESULTs; an engine cannot be aggregated.
// Threading: any thread.
//
// Next on the reader's path: ScriptEngine.h.
#pragma once

#include <unknwn.h>

IClassFactory* ScriptEngineFactory();  // not counted
