// SPDX-License-Identifier: MIT
// The groups of macro functions.
//
// Errors: a function throws WrongCall (MacroCall::Fail) before it changes anything. A function that
// returns a text must not change anything, because the text is checked after the call.
#pragma once

#include <span>

#include "functions/MacroFunctions.h"

struct FunctionGroup {
  const char* name;  // for the user
  std::span<const MacroFunction> functions;
};

FunctionGroup TextGroup();       // Text.cpp
FunctionGroup LineGroup();       // Lines.cpp
FunctionGroup CursorGroup();     // Cursor.cpp
FunctionGroup SelectionGroup();  // Selection.cpp
FunctionGroup DeletingGroup();   // Deleting.cpp
FunctionGroup FindGroup();       // Find.cpp
FunctionGroup CaseGroup();       // Case.cpp
FunctionGroup MarkGroup();       // Marks.cpp
FunctionGroup ClipboardGroup();  // Clipboard.cpp
FunctionGroup UndoGroup();       // Undo.cpp
FunctionGroup DocumentGroup();   // Documents.cpp
FunctionGroup MacroGroup();      // Macro.cpp
