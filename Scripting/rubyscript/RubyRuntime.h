// SPDX-License-Identifier: MIT
// Starts CRuby inside a process that is not its own: without a command line, rubygems or the
// environment's options, and with the host's process state as it was (see HostProcess.h). Defines
// the engine's module `ActiveScript`, native part and prelude/.
//
// Threading: Ruby side (see Interpreter.h).
#pragma once

// Once, on the interpreter's stack. False: CRuby has not come up; it cannot be tried again.
bool StartRuby();

// The variables that CRuby has added to the environment at its start, for the time of a run.
void ApplyRubyEnvironment();
