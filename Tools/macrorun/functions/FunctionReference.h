// SPDX-License-Identifier: MIT
// The table of macro functions (MacroFunctions.h) for people and their tools. Everything that is told
// here comes from that table.
//
// Texts are UTF-8 with LF. Errors: none. Threading: any thread.
#pragma once

#include <string>

// One line for each function, under its group.
std::string FunctionList();

// Docs/functions.md.
std::string FunctionMarkdown();

// A Ruby file with an empty method for each function, documented by YARD's tags, and the variable
// @tarn. Language servers read it; macros never do.
std::string FunctionStubs();
