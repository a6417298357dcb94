// SPDX-License-Identifier: MIT
// Keeps macros apart in the classes and modules that all of them share: methods, constants, included
// modules, variables of the class, and whether it is frozen. Suspend takes a macro's changes out of
// Ruby, Resume puts them back; what a library changes while it loads is everybody's.
//
// All of it is done in CRuby's tables: no method is called and no hook runs, so nothing that a macro
// redefines, freezes or traces can get in the way, and the engine's Ruby code, which runs while the
// changes are out, finds Ruby as it was at the start.
//
// Not covered: classes in no constant, values of variables and constants that are changed in place.
// Errors: NoMemoryError. Threading: Ruby side (see Interpreter.h).
#pragma once

#include <ruby.h>

class ClassSnapshot {
 public:
  // Once, when the engine's Ruby part has been loaded.
  static void Start();
  // Takes the changes out that are in place. The context they belong to; Qnil when there are none.
  static VALUE Suspend();
  // Puts the context's changes in place. Those of no other context may be.
  static void Resume(VALUE context);
  // Takes changes out for good that were made while none were in place.
  static void DropChanges();
};
