// SPDX-License-Identifier: MIT
// Starts CRuby inside a process that is not its own: without a command line, rubygems or the
// environment's options, and with the host's process state as it was (see ProcessStateSnapshot.h). Defines
// the engine's module `ActiveScript`, native part and prelude/.
//
// Threading: Ruby side (see Interpreter.h) unless stated otherwise.
#pragma once

// Once, on the interpreter's stack. False: CRuby has not come up; it cannot be tried again.
bool StartRuby();

// The variables that CRuby has added to the environment at its start, for the time of a run.
void ApplyRubyEnvironment();

// Ends the thread of Ruby's that calls it, whatever it is in.
[[noreturn]] void EndRubyThread();

// Any thread. Whether CRuby has made the thread; whether the address is in CRuby's library,
// or nowhere, where only a wild jump leads.
bool IsRubyThread();
bool IsRubyCode(const void* address);
