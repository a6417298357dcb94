// SPDX-License-Identifier: MIT
// Whole files as text. Threading: any thread.
#pragma once

// `name` is in the system's ANSI code page.
// The file's bytes as wide text in the C runtime's current locale, terminated; null when there is
// no name or the file cannot be opened, measured, read or held in memory. A byte that the locale
// cannot convert ends the text. The caller frees it with CoTaskMemFree.
wchar_t* LoadFileAsWideText(const char* name);
