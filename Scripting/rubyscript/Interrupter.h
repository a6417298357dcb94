// SPDX-License-Identifier: MIT
// Ends Ruby code that calls nothing: an endless loop, a long sleep, a long match. A second Ruby thread
// waits outside of the interpreter's lock for Wake; then it raises `ActiveScript::Stop` on the main
// thread, which ends waits and matches, and sets a hook there. The hook sees the exception, or the
// next line if that comes first, and leaves the task in its place, so no `rescue` takes it and
// `ensure` blocks run undisturbed. These get a grace of half a second.
#pragma once

class Interrupter {
 public:
  // Ruby side, before a macro runs: starts the thread, unless it is alive. A macro may have ended it.
  static void EnsureAlive();
  // Ruby side, behind interruptible code: takes back what was under way when the code ended.
  static void Settle();
  static void RemoveHook();
  // Ruby side: when the exception comes out of the present fiber, the task is left there.
  static void LeaveAtResumer();
  // Ruby side, another thread of Ruby's: raises the exception, without the rest.
  static void StopMainThread();
  // Any thread. Looks at Interpreter::InterruptDue as soon as Ruby code runs.
  static void Wake();
};
