// SPDX-License-Identifier: MIT
// One run of a macro over a document: this program's side of the host macro interface.
#pragma once

#include <filesystem>

#include "Document.h"
#include "ExitCode.h"
#include "ScriptModule.h"

// Runs `macro`, which changes `document`. Messages go to standard error, with `trace` the module's
// debug lines too. Throws UsageError.
ExitCode RunMacro(ScriptModule& module, const std::filesystem::path& macro, Document& document,
                  bool trace);
