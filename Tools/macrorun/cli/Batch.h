// SPDX-License-Identifier: MIT
// Runs a macro on the texts of the command line and writes the results.
//
// Errors: with several texts, the errors of one go to the reporter and into the exit code;
// UsageError for errors that prevent all runs. Threading: the main thread.
#pragma once

#include "cli/Options.h"
#include "platform/ExitCode.h"
#include "report/Reporter.h"

// Returns the highest exit code. A stop or a fault ends the batch.
ExitCode RunBatch(const Options& options, Reporter& reporter);
