// SPDX-License-Identifier: MIT
// One run of a macro over documents: this program's side of the host macro interface.
//
// Ownership: everything in the context is the caller's. Errors: those of the macro go to the
// reporter and into the exit code; UsageError for a macro that cannot be read, or that the module
// cannot name.
// Threading: the thread that loaded the module.
#pragma once

#include <filesystem>
#include <set>
#include <string>

#include "document/Editor.h"
#include "host/RunOptions.h"
#include "host/RunningEngines.h"
#include "host/ScriptModule.h"
#include "platform/ExitCode.h"
#include "report/CallProfile.h"
#include "report/Reporter.h"

// What stays the same from run to run.
struct RunContext {
  const RunOptions& options;
  ScriptModule& module;
  const Language& language;
  RunningEngines& engines;
  Reporter& reporter;
  CallProfile& profile;
  std::set<std::string> argumentsRead = {};  // the names that macros have asked for
};

// Runs the options' macro, which changes the editor's documents, as often as they say and until a run
// fails. Each run is one step.
ExitCode RunMacro(RunContext& context, Editor& editor);
