// SPDX-License-Identifier: MIT
// Runs the macros of a folder as tests (TestFolder.h): each over the text in NAME.in, or an empty one, and
// its text compared with the one in NAME.out. What a macro says or does besides is not looked at.
//
// All run in this process, language by language. Nothing in the folder is written, except what
// --promote asks for and what the macros themselves write.
//
// Errors: those of one test go to the reporter and into the exit code; UsageError for what keeps all from
// running, such as a folder without macros. Threading: the main thread.
#pragma once

#include "cli/Options.h"
#include "platform/ExitCode.h"
#include "report/Reporter.h"

// The worst of the exit codes; kMacroFailed for another text. A stop and a fault end the whole.
ExitCode RunMacroTests(const Options& options, Reporter& reporter);
