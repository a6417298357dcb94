// SPDX-License-Identifier: MIT
#include "xLib/xApp.h"

#include <windows.h>

#include "cLib/cReport.h"
#include "cLib/cString.h"

static bool runsInApplication = true;
static HWND mainWindow = nullptr;
static bool dialogOpen = false;

bool RunsInApplication() { return runsInApplication; }
void SetRunsInApplication(bool runs) { runsInApplication = runs; }

void* MainWindow() { return mainWindow; }
void SetMainWindow(void* window) { mainWindow = static_cast<HWND>(window); }

bool AskBreakIntoDebugger(const char* file, int line) {
  if (dialogOpen) return false;
  dialogOpen = true;
  MSG quit;
  const bool quitting = PeekMessageA(&quit, nullptr, WM_QUIT, WM_QUIT, PM_REMOVE) != 0;
  String question("ASSERT: File ");
  question.Append(file);
  String rest;
  rest.Format(", Line %d\nDo you wish to attempt to break into the debugger?", line);
  question.Append(rest.Text());
  const int answer = MessageBoxA(mainWindow, question.Text(), "Assertion Failed",
                                 MB_YESNO | MB_ICONWARNING | MB_TASKMODAL | MB_SETFOREGROUND);
  dialogOpen = false;
  if (quitting) PostQuitMessage(static_cast<int>(quit.wParam));
  return answer == IDYES;
}

void VerifyMainApplication(const void* application, const char* file, int line) {
  if (application) return;
  static constexpr char kFailure[] = "No main application object has been defined!";
  Report(file, line, kFailure, kReportVerify);
  if (AskBreakIntoDebugger(file, line)) DebugBreak();
  ShowExceptionBox(kFailure);
}

void ShowExceptionBox(const char* text) {
  MessageBoxA(nullptr, text, "Exception", MB_OK | MB_ICONSTOP);
}
