// SPDX-License-Identifier: MIT
// What the library win32ole needs inside of the engine: its calls of COM are made on the host's stack,
// like those of ComObject, and its event sinks and Ruby objects enter Ruby as a task of their engine.
// scripts/win32ole.patch has the other side, and the same structure.
//
// Ownership: win32ole's references belong to the engine whose macro took them; closing it gives them
// back.
#pragma once

#include <windows.h>
// Last: it renames what the header above uses.
#include <ruby.h>

// Defines `ole_embedder`, which win32ole asks for when it is loaded, in the engine's module.
void DefineOleEmbedder(VALUE module);

// Ruby side: puts off the end of all references that the innermost task's engine has taken through
// win32ole. Event sinks and Ruby objects that it has handed out answer no call from then on.
void CloseOleObjects();

// Host side: makes the calls that win32ole has put off, such as releases found by the collector.
void RunDeferredCalls();
