// SPDX-License-Identifier: MIT
// The process-wide active code page, to which String converts wide text, and the conversions
// between it and UTF-16.
//
// Threading: the active code page is set once at start-up and only read afterwards.
#pragma once

#include "cLib/cTypes.h"

constexpr u32 kUtf8CodePage = 65001;

u32 ActiveCodePage();  // UTF-8 until it is set

// Takes the default ANSI code page of the keyboard layout's language; UTF-8 when there is none.
void SetActiveCodePageFromKeyboard();

// Convert `n` units (-1: NUL-terminated, the NUL counting as one) into `room` units at `out` and
// return how many the system says it wrote: 0 on failure, also when they do not fit. A `room` of 0
// only asks how many are needed. The result is terminated where room is left: by up to four zero
// units in UTF-16 (nothing is written there on failure), by up to two zero bytes otherwise.
int MultiByteToUtf16(const char* s, int n, wchar_t* out, int room, u32 codePage = ActiveCodePage());
int Utf16ToMultiByte(const wchar_t* w, int n, char* out, int room, u32 codePage = ActiveCodePage());
