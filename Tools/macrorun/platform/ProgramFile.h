// SPDX-License-Identifier: MIT
// The file of this program, and its folder.
#pragma once

#include <filesystem>

std::filesystem::path ProgramFile();
std::filesystem::path ProgramFolder();
