// SPDX-License-Identifier: MIT
// Answers every message box of the thread from a timer, which runs inside it, and notes it.
#pragma once

#include <windows.h>

#include <functional>
#include <string>

// Called with what the open box shows.
inline std::function<void(const std::string& box)> onBox;
inline int boxAnswer = IDNO;

inline void CALLBACK AnswerBox(HWND, UINT, UINT_PTR, DWORD) {
  const HWND box = GetActiveWindow(), icon = FindWindowExA(box, nullptr, "Static", nullptr);
  const LRESULT stop = reinterpret_cast<LRESULT>(LoadIconA(nullptr, IDI_HAND));
  char caption[256], text[1024];
  if (!GetDlgItemTextA(box, 0xFFFF, text, sizeof text)) return;
  GetWindowTextA(box, caption, sizeof caption);
  onBox((SendMessageA(icon, STM_GETICON, 0, 0) == stop ? "stop box " : "box ") +
        std::string(caption) + ": " + text);
  EndDialog(box, boxAnswer);
}
inline const UINT_PTR boxTimer = SetTimer(nullptr, 0, 1, AnswerBox);
