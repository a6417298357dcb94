// SPDX-License-Identifier: MIT
// Runs a macro on documents, as the host of the scripting module.
//
// Ownership: everything in the context is the caller's. Errors: those of the macro go to the
// reporter and into the exit code; UsageError for a macro whose path the module cannot represent.
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

// What the runs of one macro share.
struct RunContext {
  const RunOptions& options;
  ScriptModule& module;
  const Language& language;
  RunningEngines& engines;
  Reporter& reporter;
  CallProfile& profile;
  std::set<std::string> argumentsRead = {};  // the names that macros have read
};

// Runs the options' macro as often as they say, until a run fails. Each run is one undo step of the
// editor's documents.
ExitCode RunMacro(RunContext& context, Editor& editor);
