// SPDX-License-Identifier: MIT
// A module whose every run ends as a fault does. It calls the host by slot number, and writes a
// line into its log.
#include <windows.h>

static void Log(const char* line) {
  char path[256];
  if (GetEnvironmentVariableA("SCRIPTRUBY_LOG", path, sizeof path) == 0) return;
  const HANDLE file = CreateFileA(path, GENERIC_WRITE, 0, nullptr, CREATE_ALWAYS, 0, nullptr);
  DWORD written = 0;
  WriteFile(file, line, lstrlenA(line), &written, nullptr);
  CloseHandle(file);
}

extern "C" int __stdcall execute(const char*, void* host) {
  Log("a line of the module\n");
  using ReportMessage = void(__thiscall*)(void* self, const char* text);
  void** slots = *static_cast<void***>(host);
  reinterpret_cast<ReportMessage>(slots[2])(
      host, "Tarn has detected an internal scripting exception, most probably caused\n");
  return -1;
}

extern "C" bool __stdcall kill(int) { return false; }
extern "C" bool __stdcall version(void*, const char*) { return false; }
