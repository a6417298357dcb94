// SPDX-License-Identifier: MIT
#include "cLib/cHost.h"

// Volatile: `kill` reads it on any thread, each time once.
static HostInterface* volatile currentHost = nullptr;

HostInterface* CurrentHost() { return currentHost; }

void SetCurrentHost(HostInterface* host) { currentHost = host; }

void TraceTo(HostInterface* host, const char* text) {
  if (host) host->DebugOutput("Debug: %s\n", text);
}
