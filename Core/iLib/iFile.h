// SPDX-License-Identifier: MIT
// Whole files as text.
#pragma once

// The file's bytes as wide text in the C runtime's current locale, terminated; null when the file
// cannot be opened, measured, read or held in memory. A byte that the locale cannot convert ends
// the text. The caller frees it with CoTaskMemFree.
wchar_t* LoadFileAsWideText(const char* name);
