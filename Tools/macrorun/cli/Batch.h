// SPDX-License-Identifier: MIT
// All runs of one call of the program: each text through the macro, as often as asked for, and to
// where it belongs.
//
// Errors: those of one text of several go to the reporter and into the exit code; UsageError for what
// keeps all from running. Threading: the main thread.
#pragma once

#include "cli/Options.h"
#include "platform/ExitCode.h"
#include "report/Reporter.h"

// The worst of the exit codes. A stop and a fault end the whole.
ExitCode RunBatch(const Options& options, Reporter& reporter);
