// SPDX-License-Identifier: MIT
// A module whose every run ends as a fault does. It calls the host by slot number.
#include <windows.h>

extern "C" int __stdcall execute(const char*, void* host) {
  using ReportMessage = void(__thiscall*)(void* self, const char* text);
  void** slots = *static_cast<void***>(host);
  reinterpret_cast<ReportMessage>(slots[2])(
      host, "Tarn has detected an internal scripting exception, most probably caused\n");
  return -1;
}

extern "C" bool __stdcall kill(int) { return false; }
extern "C" bool __stdcall version(void*, const char*) { return false; }
