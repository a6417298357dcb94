// SPDX-License-Identifier: MIT
// Ends Ruby code that calls nothing: an endless loop, a long sleep, a long match. A second Ruby thread
// waits outside of the interpreter's lock for Wake; then it raises `ActiveScript::Stop` on the main
// thread, which also wakes it from a wait, and sets a hook there that leaves the code at its next
// line even when the code rescues the exception. `ensure` blocks get a grace of half a second.
#pragma once

class Interrupter {
 public:
  // Ruby side, before a macro runs: starts the thread, unless it is alive. A macro may have ended it.
  static void EnsureAlive();
  // Ruby side, behind interruptible code: takes back what was under way when the code ended.
  static void Settle();
  // Any thread. Looks at Interpreter::InterruptDue as soon as Ruby code runs.
  static void Wake();
};
