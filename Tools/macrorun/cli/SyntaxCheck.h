// SPDX-License-Identifier: MIT
// Checks macros for syntax errors: each is parsed by its script engine, which is never started. A small
// Active Scripting host of its own, without the module.
//
// Errors: those of a macro go to the reporter and into the exit code, and so does a macro that cannot
// be read. Threading: the main thread.
#pragma once

#include "cli/Options.h"
#include "platform/ExitCode.h"
#include "report/Reporter.h"

// The worst of the exit codes of the options' macros.
ExitCode CheckMacros(const Options& options, Reporter& reporter);
