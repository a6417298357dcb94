// SPDX-License-Identifier: MIT
// What the Core library knows of the application around it, and the dialog that offers to break
// into the debugger.
//
// Threading: none; the state is plain and process-wide, one thread at a time.
//
// Only an application calls the dialog and the check; the module is a library and does not.
#pragma once

// Whether an application contains the Core library. The module clears this when it is loaded: it is
// a library, and must not run code that is for applications only.
bool RunsInApplication();
void SetRunsInApplication(bool runs);

// The application object's main window (HWND), owner of the assertion dialog; null without one.
void* MainWindow();
void SetMainWindow(void* window);

// Asks whether to break into the debugger for the failed check at `file`, `line`. True when the
// user chose Yes: the caller then breaks. False at once while the dialog is already open. A quit
// message that is waiting is held back for the dialog's time.
bool AskBreakIntoDebugger(const char* file, int line);

// Checks that there is a main application object. Without one the failure is reported (level
// VERIFY), the dialog is offered and the failure is shown; the caller goes on all the same.
void VerifyMainApplication(const void* application, const char* file, int line);

// Shows a failure in a box without owner, captioned "Exception".
void ShowExceptionBox(const char* text);
