// SPDX-License-Identifier: MIT
// FIFO: a history of fixed size, newest element first. Stack: an Array used last in, first out.
//
// Both hold pointers to heap objects of one class, and own them by default.
// Broken preconditions and missing memory are reported (source "cFilo").
// Threading: none; one thread at a time.
#pragma once

#include <stddef.h>

#include "cLib/cArray.h"
#include "cLib/cMemory.h"
#include "cLib/cReport.h"
#include "cLib/cSlots.h"
#include "cLib/cTypes.h"

template <class T>
class FIFO {
 public:
  // Reported: a size below 1 or no memory; the history then has no slots and takes no elements.
  explicit FIFO(i32 slots);
  SLOTS_FROM(0);
  SLOT(0) ~FIFO() {
    for (u32 i = 0; i < size; ++i) Drop(i);
    ReleaseBlock(items);
  }
  FIFO(const FIFO&) = delete;
  FIFO& operator=(const FIFO&) = delete;

  u32 Size() const { return size; }
  void SetOwnsElements(bool owns) { ownsElements = owns ? 1 : 0; }
  T* At(i32 index) const { return HasSlot(index) ? items[index] : nullptr; }

  // Puts `item` into slot 0 and moves the others one slot on; the last one falls off and is deleted
  // (owning) or reported as a leak. A null item is reported and pushed all the same. False when
  // there are no slots: the item is then still the caller's.
  bool Push(T* item);
  // Removes an element, deleting it when owning, and closes the gap. Reported: no such slot.
  void RemoveAt(i32 index);
  // Stores `item`, deleting what was there when owning. False, and reported: no such slot.
  bool SetAt(T* item, i32 index);

 private:
  bool HasSlot(i32 index) const { return index >= 0 && static_cast<u32>(index) < size; }

  // Empties a slot; the element leaves it before it is deleted.
  void Drop(u32 index) {
    T* item = items[index];
    items[index] = nullptr;
    if (ownsElements) delete item;
  }

  u32 ownsElements = 1;  // flag
  T** items = nullptr;   // owned block of `size` pointers
  u32 size = 0;
};

static_assert(sizeof(FIFO<int>) == 16, "virtual table, flag, slots, size");

template <class T>
FIFO<T>::FIFO(i32 slots) {
  static_assert(offsetof(FIFO, ownsElements) == 4 && offsetof(FIFO, items) == 8, "fixed order");
  if (slots < 1) {
    REPORT_ASSERT("cFilo", "Size below one slot");
    return;
  }
  const u32 wanted = static_cast<u32>(slots);
  items = static_cast<T**>(AllocateZeroedBlock(MultiplySizes(wanted, sizeof(T*))));
  if (items)
    size = wanted;
  else
    REPORT_ASSERT("cFilo", "No memory for the slots");
}

template <class T>
bool FIFO<T>::Push(T* item) {
  if (!item) REPORT_ASSERT("cFilo", "Null element");
  if (!size) return false;
  T* const last = items[size - 1];
  if (last && last != item) {
    if (!ownsElements) REPORT_ASSERT("cFilo", "Memory leak deteched");
    Drop(size - 1);
  }
  for (u32 i = size - 1; i > 0; --i) items[i] = items[i - 1];
  items[0] = item;
  return true;
}

template <class T>
void FIFO<T>::RemoveAt(i32 index) {
  if (!HasSlot(index)) {
    REPORT_ASSERT("cFilo", "Index out of range");
    return;
  }
  Drop(static_cast<u32>(index));
  for (u32 i = static_cast<u32>(index); i + 1 < size; ++i) items[i] = items[i + 1];
  items[size - 1] = nullptr;
}

template <class T>
bool FIFO<T>::SetAt(T* item, i32 index) {
  if (!HasSlot(index)) {
    REPORT_ASSERT("cFilo", "Index out of range");
    return false;
  }
  if (items[index] != item) Drop(static_cast<u32>(index));
  items[index] = item;
  return true;
}

template <class T>
class Stack {
 public:
  SLOTS_FROM(0);
  SLOT(0) ~Stack() = default;
  Stack() = default;
  Stack(const Stack&) = delete;
  Stack& operator=(const Stack&) = delete;

  i32 Depth() const { return depth; }
  void SetOwnsElements(bool owns) { items.SetOwnsElements(owns); }

  // False, and reported, when there is no memory: the item is then still the caller's.
  bool Push(T* item) {
    if (items.SetAt(item, depth) < 0) {
      REPORT_ASSERT("cFilo", "No memory for the slots");
      return false;
    }
    ++depth;
    return true;
  }
  // Takes the newest element off; it is the caller's. Null when the stack is empty.
  T* Pop() { return depth > 0 ? items.Detach(--depth) : nullptr; }
  // The newest element, null when the stack is empty.
  T* Top() const { return items.At(depth - 1); }
  void Clear() {
    items.Clear();
    depth = 0;
  }

 private:
  Array<T> items;  // slots at and above `depth` are null while it owns
  i32 depth = 0;
};
