// SPDX-License-Identifier: MIT
// Parts of the module's reports by which this program parses them, besides those in xLib/xTexts.h.
// Core/xLib/xScriptExecutor.cpp and xScript.cpp write them.
#pragma once

#include <string_view>

#include "xLib/xTexts.h"

// "Scripting Error :>  File: FILE (LINE:COLUMN) >> SOURCE\nReason: DESCRIPTION"
inline constexpr std::string_view kFileMark = " File: ";
inline constexpr std::string_view kSourceMark = ") >> ";
inline constexpr std::string_view kReasonMark = "\nReason: ";

// Followed by the name of the function.
inline constexpr std::string_view kUnknownFunctionReport =
    "Call to unknown macro scripting function:  ";

// Reports that follow a script error and repeat that the macro failed.
inline constexpr std::string_view kFollowUpReports[] = {"\nError parsing '", "\nError executing '"};
