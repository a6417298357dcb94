// SPDX-License-Identifier: MIT
// Calls of macro functions: from scripts, and straight through IDispatch.
#pragma once

class Section;

// On a thread with an apartment, for which the Ruby engine is activated. False, with the reason on
// standard error, when something does not run; an exception when a file is missing.

// From JScript and from Ruby, against calls of an object that converts nothing.
bool CompareCalls(Section& section);
// The module's object against that one from C++, and what the parts of a call cost. For the rest of
// the process JScript is an engine that does nothing.
bool CompareDispatch(Section& section);
