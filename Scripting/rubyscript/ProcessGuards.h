// SPDX-License-Identifier: MIT
// Methods in place of CRuby's own that would end, replace or signal the host's process: at_exit,
// exit!, abort, exec, Process.kill. What would do so ends the macro at most. They are native so that
// backtraces hold no frame of the engine. A macro can define its own in their place.
//
// Threading: Ruby side (see Interpreter.h).
#pragma once

// Once, at the start.
void DefineProcessGuards();
