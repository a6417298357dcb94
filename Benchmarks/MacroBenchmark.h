// SPDX-License-Identifier: MIT
// A whole macro over a whole file, as a user runs it.
#pragma once

class Section;

// macrorun with a Ruby macro over a log of 20 MB, against ruby.exe with a program that does the same.
// False, with the reason on standard error, when one fails or they differ in what they write.
bool CompareLogMacro(Section& section);
