// SPDX-License-Identifier: MIT
// The calls of a Ruby macro that led to the present host call.
#pragma once

#include <windows.h>
// activscp.h needs windows.h before it.
#include <activscp.h>

#include <string>

// "macro:3:in `f'" a line, innermost first, without the macros that run this one; empty when the
// engine reports an error. Call it on the engine's thread, during a call of a macro function.
std::string RubyCallChain(IActiveScriptParse& engine);
