// SPDX-License-Identifier: MIT
// Names and texts of the module by which hosts and tools recognise what it means.
#pragma once

// The language description file, in the module's or the user's product folder.
constexpr char kDescriptionFileName[] = "xMacroWSH.qwsh";

// How the report of a script error begins, and the one of a fault in a run.
constexpr char kScriptErrorReport[] = "Scripting Error :> ";
constexpr char kFaultReport[] = "Tarn has detected an internal scripting exception";
