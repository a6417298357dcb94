// SPDX-License-Identifier: MIT
// The Core library's String, Array and cHashTable beside the C++ library's, as curves over the size.
#pragma once

class Section;

// The chart's file has a block for each case: a line with its title and its peer's, then one for each
// size: case, size, nanoseconds for each element, the peer's, by tabs. Two empty lines end it.
bool CompareLibrary(Section& section);
