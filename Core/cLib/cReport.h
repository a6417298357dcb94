// SPDX-License-Identifier: MIT
// The process-wide reporter of trace lines and failed assertions. Every Core class reports a broken
// precondition here and then carries on; nothing here throws or ends the program.
//
// A line goes to the log file, when one is named, and in a short form to the debug-output hook,
// when one is installed. The file is opened and closed for every line, so the log survives a crash
// up to its last line.
//
// Threading: none. The state is plain and process-wide; one thread at a time.
#pragma once

enum ReportLevel {
  kReportTrace = 1,
  kReportAssert = 2,     // a failed precondition
  kReportVerify = 3,     // a condition that must hold in release builds too
  kReportException = 4,  // a caught fault
  kReportTimestamp = 5,  // the text is prefixed with the local time
  kReportRuntime = 6,    // log file only, never the hook
};

// Must return: a hook that leaves by a jump or a fault is not called again.
using DebugHook = void (*)(const char* line);

// Logs `text` (null counts as empty) and passes it to the hook. `file` is the unit's source name,
// null for a line without source position. Returns the reporting depth after the call: 0, or more
// inside a hook that reports again; the hook itself is only called at depth 1.
int Report(const char* file, int line, const char* text, int level);

// Names the log file (copied, at most 255 characters); null or empty means no log file.
void SetLogFile(const char* path);

// Appends one line to the log file, adding a line end when it has none. Silently does nothing when
// no log file is named or it cannot be opened. A null `line` counts as empty.
void WriteLogLine(const char* line);

// Installs the hook (null: none) and returns the one it replaces.
DebugHook SetDebugHook(DebugHook hook);

// Writes the text unchanged to standard output; null writes nothing.
void WriteStdout(const char* text);

// Reports a failed precondition of the unit `source`, with the line of the macro's use.
#define REPORT_ASSERT(source, text) Report(source, __LINE__, text, kReportAssert)
