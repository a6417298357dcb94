// SPDX-License-Identifier: MIT
// Numbers the virtual operations of a class where they are declared, so that swapping two lines
// does not compile:
//
//   SLOTS_FROM(0);
//   SLOT(0) ~Shape();
//   SLOT(1) void Draw();
//
// SLOTS_FROM names the first slot of the class's own (after the inherited ones). Overrides need no
// number: they keep their base's slot. An operation added without a number is caught by the list of
// virtual tables that the tests compare.
#pragma once

#define SLOTS_FROM(first) enum : int { kSlotBase = __COUNTER__ + 1 - (first) }

#define SLOT(number)                                                                    \
  static_assert(__COUNTER__ - kSlotBase == (number), "virtual operation out of order"); \
  virtual
