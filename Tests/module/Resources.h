// SPDX-License-Identifier: MIT
// What this process holds of the system.
#pragma once

#include <windows.h>
// psapi.h must come after windows.h.
#include <psapi.h>

#include <cstdint>

struct Resources {
  unsigned kilobytes;  // private to the process
  unsigned handles;
};

// Wine does not count handles, but a new one takes the lowest free number.
inline Resources Used() {
  PROCESS_MEMORY_COUNTERS counters = {};
  K32GetProcessMemoryInfo(GetCurrentProcess(), &counters, sizeof counters);
  const HANDLE lowest = CreateEventA(nullptr, FALSE, FALSE, nullptr);
  CloseHandle(lowest);
  return {static_cast<unsigned>(counters.PagefileUsage / 1024),
          static_cast<unsigned>(reinterpret_cast<uintptr_t>(lowest) / 4)};
}
