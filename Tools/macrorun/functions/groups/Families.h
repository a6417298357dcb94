// SPDX-License-Identifier: MIT
// The families of macro functions, each in the file of its name.
//
// Errors: a function throws WrongCall (MacroCall::Fail) before it changes anything. One that
// answers a text changes nothing at all, since whether the text can pass shows only afterwards.
#pragma once

#include <span>

#include "functions/MacroFunctions.h"

struct Family {
  const char* name;  // for the user
  std::span<const MacroFunction> functions;
};

Family TextFamily();       // Text.cpp
Family LineFamily();       // Lines.cpp
Family CursorFamily();     // Cursor.cpp
Family SelectionFamily();  // Selection.cpp
Family DeletingFamily();   // Deleting.cpp
Family FindFamily();       // Find.cpp
Family CaseFamily();       // Case.cpp
Family MarkFamily();       // Marks.cpp
Family ClipboardFamily();  // Clipboard.cpp
Family UndoFamily();       // Undo.cpp
Family DocumentFamily();   // Documents.cpp
Family MacroFamily();      // Macro.cpp
