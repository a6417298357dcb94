// SPDX-License-Identifier: MIT
// Documentation generated from the table of macro functions (MacroFunctions.h).
//
// Texts are UTF-8 with LF. Errors: none. Threading: any thread.
#pragma once

#include <string>

// One line for each function, by group.
std::string FunctionList();

// Docs/functions.md.
std::string FunctionMarkdown();

// A Ruby file for language servers: an empty method with YARD tags for each function, and the
// variable @tarn. Macros do not load it.
std::string FunctionStubs();
