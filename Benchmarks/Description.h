// SPDX-License-Identifier: MIT
// The description file as the module's profile reads have it, without the module: a peer.
#pragma once

#include <filesystem>

// The fifteen reads by the system's profile functions, of each key by itself. False when the file
// names no engine.
bool ReadDescription(const std::filesystem::path& file);
