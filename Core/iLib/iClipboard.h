// SPDX-License-Identifier: MIT
// Reading text from the clipboard, in the system's ANSI code page. Threading: any one thread.
#pragma once

#include "cLib/cString.h"

// Copies the clipboard's 8-bit text into `out`, which is empty when there is none. True when the
// clipboard offered text and could be opened.
bool GetClipboardText(String& out);
