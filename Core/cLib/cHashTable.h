// SPDX-License-Identifier: MIT
// cHashTable: a map from text keys to 32-bit values: pointers to elements, or numbers. Keys that
// differ only in the case of A to Z are the same key, in every locale. A value of 0 looks like an
// absent key; a null key is the empty key.
//
// An owning table (the default) deletes its elements when it is cleared or destroyed, and only
// then: a value that Insert replaces or Remove returns is the caller's. A table that found no
// memory when it was made has no buckets and takes no entries. Threading: none; one thread at a
// time.
#pragma once

#include <stddef.h>

#include "cLib/cSlots.h"
#include "cLib/cTypes.h"

// lookup3's byte-wise little-endian hash of `size` bytes; `fold` reads A to Z as small letters.
u32 HashBytes(const char* bytes, u32 size, u32 initial, bool fold);

class cHashTableBase {
 public:
  // May remove the entry it is called for; `key` is then gone.
  using WalkCallback = void (*)(const char* key, u32 value);

  SLOTS_FROM(0);
  SLOT(0) ~cHashTableBase();
  cHashTableBase(const cHashTableBase&) = delete;
  cHashTableBase& operator=(const cHashTableBase&) = delete;

  u32 EntryCount() const { return table.entryCount; }
  void SetOwnsElements(bool owns) { ownsElements = owns ? 1 : 0; }

  // Replaces the value of an existing key and returns the old one; else adds the entry and returns
  // `value`; 0 when there is no memory.
  u32 Insert(const char* key, u32 value);
  u32 Find(const char* key) const;  // 0 when absent
  // Remove the entry and return its value; 0 when absent, or when it does not have `value`.
  u32 Remove(const char* key);
  u32 RemoveIfValue(const char* key, u32 value);
  // Calls back for every entry, bucket by bucket, the newest entry of a bucket first.
  void Walk(WalkCallback callback) const;

 protected:
  using Deleter = void (*)(u32 value);

  cHashTableBase();
  void ClearWith(Deleter deleter);

  u8 ownsElements = 1;  // flag

 private:
  struct Entry {
    char* key;  // the table's own copy
    u32 value;
    Entry* next;  // in the same bucket
  };
  struct Table {
    u32 bucketCount;  // 0 when there was no memory
    u32 entryCount;
    Entry** buckets;  // owned block of `bucketCount` chains
  };

  // The link that leads to the key's entry, or to null where its chain ends; null without buckets.
  Entry** Link(const char* key) const;
  Entry** Bucket(const char* key) const;
  u32 Unlink(Entry** link);
  static void CheckLayout();

  Table table = {};
};

template <class T>
class cHashTable : public cHashTableBase {
 public:
  ~cHashTable() override { Clear(); }

  void Clear() { ClearWith(ownsElements ? DeleteElement : nullptr); }

 private:
  static void DeleteElement(u32 value) { delete reinterpret_cast<T*>(value); }
};
