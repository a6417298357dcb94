// SPDX-License-Identifier: MIT
// The groups of macro functions, each in the file of its name.
//
// Errors: a function throws WrongCall (MacroCall::Fail) before it changes anything. One that
// answers a text changes nothing at all, since whether the text can pass shows only afterwards.
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
