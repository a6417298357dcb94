// SPDX-License-Identifier: MIT
// The arguments and the result of a macro function call as text for a trace.
#pragma once

#include <span>
#include <string>

#include "functions/MacroFunctions.h"

// `name(1, 2.5, "text")`, texts quoted as in JSON.
std::string CallText(const std::string& name, std::span<const HostArgument> arguments);
std::string ResultText(const MacroResult& result);
