// SPDX-License-Identifier: MIT
// Ends Ruby code that calls nothing: an endless loop, a long sleep, a long match. A second Ruby thread
// waits outside of the interpreter's lock for Wake; then it raises `ActiveScript::Stop` on the main
// thread, which no `rescue` takes (see prelude/process_guards.rb). `ensure` blocks get a grace of half a
// second; code that goes on after it is left wherever it is.
#pragma once

class Interrupter {
 public:
  // Ruby side, before a macro runs: starts the thread, unless it is alive. A macro may have ended it.
  static void EnsureAlive();
  // Ruby side, behind interruptible code: takes back what was under way when the code ended.
  static void Settle();
  // Ruby side, another thread of Ruby's: raises the exception, without the rest.
  static void StopMainThread();
  // Any thread. Looks at Interpreter::InterruptDue as soon as Ruby code runs.
  static void Wake();
};
