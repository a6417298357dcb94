// SPDX-License-Identifier: MIT
// The Core library's String, Array and cHashTable beside the C++ library's, as curves over the size.
#pragma once

class Section;

// The chart's file has a line for each case and size: case, size, nanoseconds for each element, the
// peer's, by tabs; an empty line ends a case.
bool CompareLibrary(Section& section);
