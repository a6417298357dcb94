// SPDX-License-Identifier: MIT
// A call of a bare COM object from Ruby, through the engine and through Ruby's own win32ole, in one
// interpreter.
#pragma once

// On a thread with an apartment, for which the engine is activated. False, with the reason on
// standard error, when it does not run.
bool CompareCalls();
