// SPDX-License-Identifier: MIT
// The longest texts that pass between macro and host. The module cuts longer ones.
#pragma once

#include <cstddef>

#include "iLib/iComText.h"

// In bytes. An argument of kNarrowLimit bytes is whole or cut, which the host cannot distinguish.
constexpr std::size_t kLongestArgument = kNarrowLimit - 1;
// In UTF-16 units.
constexpr std::size_t kLongestResult = kWideLimit - 1;
