// SPDX-License-Identifier: MIT
// Text between the host and Ruby. Inside, every text is UTF-8. What a host's UTF-16 units mean
// depends on the host:
//
//   kUtf16   characters, as COM means it.
//   kBytes   an 8-bit host. It widens its macro files byte by byte and keeps the low byte of each
//            unit that it gets, so each unit is one byte of UTF-8 text. It widens its answers by
//            the ANSI code page; they are converted back to the original bytes.
//
// Errors: no memory gives null or an empty text. Threading: the interpreter's thread.
#pragma once

#include <windows.h>
// Needs windows.h before it.
#include <oleauto.h>

enum class TextForm { kUtf16, kBytes };

// What a text from the host is, for kBytes.
enum class TextOrigin { kSource, kResult };

// The most bytes that a UTF-16 unit takes inside.
constexpr UINT kMostBytesPerUnit = 3;

// The caller frees it with SysFreeString. For kUtf16 the text must be valid UTF-8.
BSTR TextToHost(const char* text, UINT bytes, TextForm form);

// Writes the text to `target`, which has room for kMostBytesPerUnit a unit; returns its bytes.
UINT TextFromHost(const wchar_t* text, UINT units, TextForm form, TextOrigin origin, char* target);

// The bytes that the code page made the units from, whatever it maps them to; as far as it keeps
// them apart, which all single-byte code pages do. `target` as above; returns its bytes.
UINT BytesFromAnsi(UINT codePage, const wchar_t* text, UINT units, char* target);

// Whether each unit is a byte.
bool HoldsBytes(const wchar_t* text, UINT units);

// Whether a macro's text can be an 8-bit host's: each unit a byte, the bytes UTF-8 or in an encoding
// that the text itself names in a comment. A macro in the ANSI code page is not: as characters, it
// serves an 8-bit host as it does an ordinary one.
bool IsByteText(const wchar_t* text);
