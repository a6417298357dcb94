// SPDX-License-Identifier: MIT
// Text conversions for COM through two module-wide buffers. A result is valid until the next
// conversion in the same direction: copy it before that, or pass a separate buffer.
//
// Threading: none; the thread of the macro run only.
#pragma once

#include "cLib/cTypes.h"

constexpr u32 kNarrowLimit = 512;  // characters that reach narrow text, terminator not counted
constexpr u32 kWideLimit = 1024;   // units of a wide text, terminator included

// The low byte of each UTF-16 unit, up to the terminator or kNarrowLimit characters; no code page
// is involved, so a unit such as U+0100 ends the text. Null gives the empty text. Never null.
const char* NarrowFromWide(const wchar_t* text);
using NarrowText = char[kNarrowLimit + 1];
const char* NarrowFromWide(const wchar_t* text, NarrowText& out);  // returns `out`

// UTF-16 by the system's ANSI code page. A longer text delivers the leading units that convert to
// whole characters. Null gives the empty text. Never null.
const wchar_t* WideFromNarrow(const char* text);
