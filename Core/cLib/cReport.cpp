// SPDX-License-Identifier: MIT
#include "cLib/cReport.h"

#include <stdio.h>
#include <string.h>

#include "cLib/cCompat.h"

static constexpr u32 kLineSize = 8192;

static char logFilePath[256];
static DebugHook debugHook = nullptr;
static int reportingDepth = 0;

static const char* LevelName(int level) {
  static const char* const names[] = {"TRACE    ", "ASSERT   ", "VERIFY   ",
                                      "EXCEPTION", "TIMESTAMP", "RUNTIME  "};
  return level >= kReportTrace && level <= kReportRuntime ? names[level - 1] : "UNKNOWN";
}

// The local time without its line break, cut to the `size` bytes; empty when there is none.
static void LocalTime(char* text, u32 size) {
  const char* local = LocalTimeText();
  snprintf(text, size, "%s", local ? local : "");
  text[strcspn(text, "\r\n")] = 0;
}

// Blanks that bring a line number to seven columns; a longer number still gets one.
static const char* LinePadding(int line) {
  static const char blanks[] = "       ";
  char digits[16];
  const int columns = snprintf(digits, sizeof digits, "%d", line);
  return blanks + (columns < 6 ? columns : 6);
}

int Report(const char* file, int line, const char* text, int level) {
  if (!text) text = "";
  char now[64];
  LocalTime(now, sizeof now);
  char stamped[kLineSize];
  if (level == kReportTimestamp) {
    snprintf(stamped, sizeof stamped, "%s%s%s", now, *text ? " - " : "", text);
    text = stamped;
  }
  const char* padding = LinePadding(line);
  char buffer[kLineSize];
  if (file)
    snprintf(buffer, sizeof buffer, "[%s] %s \"%s\" (%d)%s >> %s", now, LevelName(level), file,
             line, padding, text);
  else
    snprintf(buffer, sizeof buffer, "[%s] >> %s", now, text);
  WriteLogLine(buffer);
  if (level == kReportRuntime) return reportingDepth;

  if (++reportingDepth == 1 && debugHook) {
    snprintf(buffer, sizeof buffer, "\"%s\" (%d)%s%s\n", file ? file : "", line, padding, text);
    debugHook(buffer);
  }
  return --reportingDepth;
}

void SetLogFile(const char* path) {
  snprintf(logFilePath, sizeof logFilePath, "%s", path ? path : "");
}

void WriteLogLine(const char* line) {
  if (!*logFilePath) return;
  FILE* file = fopen(logFilePath, "at");
  if (!file) file = fopen(logFilePath, "wt");
  if (!file) return;
  const size_t size = line ? strlen(line) : 0;
  if (size) fputs(line, file);
  if (!size || line[size - 1] != '\n') fputc('\n', file);
  fclose(file);
}

DebugHook SetDebugHook(DebugHook hook) {
  const DebugHook previous = debugHook;
  debugHook = hook;
  return previous;
}

void WriteStdout(const char* text) {
  if (text) WriteOutputBytes(text, static_cast<u32>(strlen(text)));
}
