// SPDX-License-Identifier: MIT
// Checks macros for syntax errors. Each is parsed by its script engine, which is never started.
// This is a small Active Scripting host without the module.
//
// Errors: those of a macro, and a macro that cannot be read, go to the reporter and into the exit
// code.
// Threading: the main thread.
#pragma once

#include "cli/Options.h"
#include "platform/ExitCode.h"
#include "report/Reporter.h"

// Returns the highest exit code of the options' macros.
ExitCode CheckMacros(const Options& options, Reporter& reporter);
