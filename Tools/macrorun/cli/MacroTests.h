// SPDX-License-Identifier: MIT
// Runs the macros of a folder as tests (TestFolder.h): each on the text of NAME.in, or an empty
// one. The result is compared with NAME.out; other effects of the macro are not checked.
//
// All tests run in this process, language by language. Only --promote and the macros write files.
//
// Errors: those of one test go to the reporter and into the exit code; UsageError for errors that
// prevent all tests, such as a folder without macros. Threading: the main thread.
#pragma once

#include "cli/Options.h"
#include "platform/ExitCode.h"
#include "report/Reporter.h"

// Returns the highest exit code; kMacroFailed for a text that differs. A stop or a fault ends the
// tests.
ExitCode RunMacroTests(const Options& options, Reporter& reporter);
