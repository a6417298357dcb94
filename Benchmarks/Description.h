// SPDX-License-Identifier: MIT
// The description file as the module's profile reads have it, without the module: a peer.
#pragma once

#include <filesystem>

// Seconds of the fifteen reads by the system's profile functions, of each key by itself; negative when
// the file names no engine.
double TimeReads(const std::filesystem::path& file);
