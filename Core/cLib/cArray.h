// SPDX-License-Identifier: MIT
// Array, List and ListIter: growable tables of pointers to heap objects of one class.
//
// An owning container (the default) deletes its elements through their virtual destructor; a
// non-owning one only forgets them. Indexes and sizes that are out of range are reported (source
// "cArray") and change nothing. Slots may be null.
//
// The layout of Array is shared with the host editor: the result texts and the argument list of the
// context record are Arrays that the host constructs and this module fills, empties and grows.
//
// Threading: none; one thread at a time.
#pragma once

#include <stddef.h>

#include "cLib/cMemory.h"
#include "cLib/cReport.h"
#include "cLib/cTypes.h"

template <class T>
class Array {
 public:
  Array() {
    static_assert(offsetof(Array, capacity) == 4, "the host reads it here");
    static_assert(offsetof(Array, count) == 8, "the host reads it here");
    static_assert(offsetof(Array, ownsElements) == 12, "the host reads it here");
    static_assert(offsetof(Array, items) == 16, "the host reads it here");
    Grow(kInitialSlots);
  }
  virtual ~Array() {
    Clear();
    ReleaseBlock(items);
  }
  Array(const Array&) = delete;
  Array& operator=(const Array&) = delete;

  i32 Count() const { return count; }
  u32 Capacity() const { return capacity; }
  bool OwnsElements() const { return ownsElements != 0; }
  void SetOwnsElements(bool owns) { ownsElements = owns ? 1 : 0; }

  // The element at `index`, null when the slot is empty or there is no such slot (not reported).
  T* At(i32 index) const { return HasSlot(index) && index < count ? items[index] : nullptr; }

  // How many slots below the count hold an element.
  u32 Occupied() const {
    u32 occupied = 0;
    for (i32 i = 0; i < count && HasSlot(i); ++i) occupied += items[i] != nullptr;
    return occupied;
  }

  // Adds `slots` empty slots. Reported, without effect: `slots` below 1, no memory.
  void Grow(i32 slots);

  // Stores `item` at `index`, growing the table when needed; appending is SetAt(item, Count()). An
  // element already there is deleted (owning) or reported as a leak (not owning). Returns `index`,
  // or -1 when there is no memory. After a negative result the item is still the caller's.
  i32 SetAt(T* item, i32 index);

  // Takes the element out of its slot without deleting it; Count() stays. Reported: no such index.
  T* Detach(i32 index);

  // Deletes the elements (owning) and sets the count to 0. Each element leaves its slot before it
  // is deleted, so a second call after a fault in a destructor goes on with the next one.
  void Clear() { Truncate(0); }

  // As Clear, but keeps the first `size` slots. `size` is at most Count(), or 0.
  void Truncate(i32 size);

  // Sets the count to 0 without looking at the elements.
  void Forget() { count = 0; }

 private:
  static constexpr i32 kInitialSlots = 50;

  bool HasSlot(i32 index) const { return index >= 0 && static_cast<u32>(index) < capacity; }

  u32 capacity = 0;      // slots in the block
  i32 count = 0;         // one past the highest slot ever stored into
  u32 ownsElements = 1;  // flag
  T** items = nullptr;   // owned block of `capacity` pointers
};

static_assert(sizeof(Array<int>) == 20, "the host's context record holds two of these");

template <class T>
void Array<T>::Grow(i32 slots) {
  if (slots <= 0) {
    REPORT_ASSERT("cArray", "Grow by less than one slot");
    return;
  }
  const u32 wanted = AddSizes(capacity, static_cast<u32>(slots));
  T** grown = static_cast<T**>(AllocateZeroedBlock(MultiplySizes(wanted, sizeof(T*))));
  if (!grown) {
    REPORT_ASSERT("cArray", "No memory for the slots");
    return;
  }
  for (i32 i = 0; i < count && HasSlot(i); ++i) grown[i] = items[i];
  ReleaseBlock(items);
  items = grown;
  capacity = wanted;
  if (count >= 0 && static_cast<u32>(count) >= capacity)
    REPORT_ASSERT("cArray", "Count beyond capacity");
}

template <class T>
i32 Array<T>::SetAt(T* item, i32 index) {
  if (index < 0) {
    REPORT_ASSERT("cArray", "Negative index");
    return index;
  }
  if (!HasSlot(index)) {
    // A fifth more than the index, and never less than the slot itself needs (a table made by the
    // host may start without any slots).
    const u32 wanted = static_cast<u32>(index) + static_cast<u32>(index) / 5;
    const u32 needed = static_cast<u32>(index) + 1 - capacity;
    const u32 slots = wanted > needed ? wanted : needed;
    Grow(slots > 0x7FFFFFFFu ? 0x7FFFFFFF : static_cast<i32>(slots));
    if (!HasSlot(index)) return -1;
  }
  // Slots that are skipped may still hold what a non-owning array has forgotten.
  for (i32 i = count < 0 ? 0 : count; i < index; ++i) items[i] = nullptr;
  T* const old = index < count ? items[index] : nullptr;
  items[index] = item;
  if (index >= count) count = index + 1;
  // The spelling is fixed: readers of logs search for it.
  if (old && !ownsElements) REPORT_ASSERT("cArray", "Memory leak deteched");
  if (old && old != item && ownsElements) delete old;
  return index;
}

template <class T>
T* Array<T>::Detach(i32 index) {
  if (!HasSlot(index) || index >= count) {
    REPORT_ASSERT("cArray", "Index out of range");
    return nullptr;
  }
  T* item = items[index];
  items[index] = nullptr;
  return item;
}

template <class T>
void Array<T>::Truncate(i32 size) {
  for (i32 i = size; ownsElements && i < count; ++i) {
    if (!HasSlot(i)) {
      REPORT_ASSERT("cArray", "Count beyond capacity");
      break;
    }
    delete Detach(i);
  }
  count = size;
}

// An Array used as a sequence.
template <class T>
class List : public Array<T> {};

// A cursor over a List, valid while the list does not shrink. Each step returns the current
// element, or null past the end. Empty slots in the list also read as null.
template <class T>
class ListIter {
 public:
  explicit ListIter(const List<T>& list) : list(list) {}
  virtual ~ListIter() = default;

  T* First() {
    position = 0;
    return Current();
  }
  T* Next() {
    if (position < list.Count()) ++position;
    return Current();
  }
  T* Current() const { return list.At(position); }

 private:
  const List<T>& list;
  i32 position = 0;
};
