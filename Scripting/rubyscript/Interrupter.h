// SPDX-License-Identifier: MIT
// Ends Ruby code that calls nothing: an endless loop, a long sleep, a long match. A second Ruby thread
// waits outside of the interpreter's lock for Wake. Then it raises `ActiveScript::Stop` on the main
// thread, which no `rescue` takes (see prelude/process_guards.rb). `ensure` blocks have half a second.
// Code that continues after that is left wherever it is.
#pragma once

class Interrupter {
 public:
  // Ruby side, before the first macro runs: starts the thread. No macro can end it.
  static void EnsureStarted();
  // Ruby side, after interruptible code: discards an interrupt that came when the code had ended.
  static void Settle();
  // Ruby side, another Ruby thread: only raises the exception.
  static void StopMainThread();
  // Any thread. The thread asks Interpreter::InterruptDue as soon as Ruby code runs.
  static void Wake();
};
