// SPDX-License-Identifier: MIT
// Every way into Ruby code: the only place that calls rb_protect. Ruby leaves frames by a jump, so no
// C++ object with a destructor may live in a frame between Protect and what raises.
//
// Threading: Ruby side (see Interpreter.h), the main thread of Ruby unless said otherwise.
#pragma once

#include <ruby.h>

enum class Outcome {
  kDone,    // the result is the body's
  kRaised,  // the result is the exception
  kLeft,    // the task was told to end; there is no result
};

// Runs body(argument). Any thread of Ruby's.
Outcome Protect(VALUE (*body)(VALUE), VALUE argument, VALUE& result);
// The same for the engine's own code, without trace functions and trace points.
Outcome ProtectUntraced(VALUE (*body)(VALUE), VALUE argument, VALUE& result);
// Calls receiver.method(arguments...).
Outcome Send(VALUE receiver, const char* method, int count, const VALUE* arguments, VALUE& result);

// Leaves the innermost task: its `ensure` blocks run, no `rescue` takes it.
[[noreturn]] void LeaveTask();

// The engine's own module, and a constant of it.
VALUE ActiveScriptModule();
VALUE ActiveScriptConst(const char* name);
// `ActiveScript::Stop`, what an interrupted macro ends with where it cannot be left otherwise.
VALUE StopClass();
