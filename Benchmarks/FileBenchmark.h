// SPDX-License-Identifier: MIT
// What the module's file and the files that it reads cost.
#pragma once

class Section;

// False, with the reason on standard error, when something does not run; an exception when a file
// is missing or cannot be written.

// Macro files of growing size, loaded and converted.
bool CompareMacroFiles(Section& section);
// The DLL: its size, loading it, and `version`.
bool CompareModuleFile(Section& section);
