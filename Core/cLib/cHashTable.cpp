// SPDX-License-Identifier: MIT
#include "cLib/cHashTable.h"

#include <string.h>

#include "cLib/cCompat.h"
#include "cLib/cMemory.h"

static constexpr u32 kBucketCount = 211;
static constexpr u32 kInitialHash = 42;

// --- The hash ------------------------------------------------------------------------------------

static u32 Rotate(u32 x, u32 bits) { return x << bits | x >> (32 - bits); }

// Stirs three words reversibly, each step a pair of them.
static void Mix(u32& a, u32& b, u32& c) {
  static const u8 rotations[] = {4, 6, 8, 16, 19, 4};
  for (const u8 bits : rotations) {
    a = (a - c) ^ Rotate(c, bits);
    c += b;
    const u32 first = a;
    a = b;
    b = c;
    c = first;
  }
}

// Lets every bit of three words reach the second one, which is the hash.
static void Finish(u32& a, u32& b, u32& c) {
  static const u8 rotations[] = {14, 11, 25, 16, 4, 14, 24};
  for (const u8 bits : rotations) {
    c = (c ^ b) - Rotate(b, bits);
    const u32 last = c;
    c = a;
    a = b;
    b = last;
  }
}

// Up to four bytes as a little-endian number.
static u32 Word(const char* bytes, u32 size, bool fold) {
  u32 word = 0;
  for (u32 i = 0; i < 4 && i < size; ++i) {
    const u32 byte = static_cast<u8>(fold ? FoldAscii(bytes[i]) : bytes[i]);
    word |= byte << (8 * i);
  }
  return word;
}

u32 HashBytes(const char* bytes, u32 size, u32 initial, bool fold) {
  u32 a = 0xDEADBEEF + size + initial;
  u32 b = a;
  u32 c = a;
  if (size == 0) return c;
  for (;; bytes += 12, size -= 12) {
    a += Word(bytes, size, fold);
    if (size > 4) b += Word(bytes + 4, size - 4, fold);
    if (size > 8) c += Word(bytes + 8, size - 8, fold);
    if (size <= 12) break;
    Mix(a, b, c);
  }
  Finish(a, b, c);
  return b;
}

// --- The table -----------------------------------------------------------------------------------

cHashTableBase::cHashTableBase() {
  const u32 size = kBucketCount * sizeof(Entry*);
  table.buckets = static_cast<Entry**>(AllocateZeroedBlock(size));
  if (table.buckets) table.bucketCount = kBucketCount;
}

cHashTableBase::~cHashTableBase() {
  ClearWith(nullptr);
  ReleaseBlock(table.buckets);
  table = {};
}

// Keys that differ only in case must share a bucket, so the hash sees them in small letters.
cHashTableBase::Entry** cHashTableBase::Bucket(const char* key) const {
  if (!table.bucketCount) return nullptr;
  const u32 hash = HashBytes(key, static_cast<u32>(strlen(key)), kInitialHash, true);
  return &table.buckets[(hash & 0xFFFF) % table.bucketCount];
}

static bool IsSameKey(const char* a, const char* b) {
  while (*a && FoldAscii(*a) == FoldAscii(*b)) ++a, ++b;
  return FoldAscii(*a) == FoldAscii(*b);
}

cHashTableBase::Entry** cHashTableBase::Link(const char* key) const {
  Entry** link = Bucket(key);
  while (link && *link && !IsSameKey((*link)->key, key)) link = &(*link)->next;
  return link;
}

u32 cHashTableBase::Insert(const char* key, u32 value) {
  if (!key) key = "";
  Entry** link = Link(key);
  if (!link) return 0;
  if (*link) {
    const u32 previous = (*link)->value;
    (*link)->value = value;
    return previous;
  }
  const u32 size = static_cast<u32>(strlen(key)) + 1;
  Entry* entry = static_cast<Entry*>(AllocateBlock(sizeof(Entry)));
  char* copy = static_cast<char*>(AllocateBlock(size));
  if (!entry || !copy) {
    ReleaseBlock(entry);
    ReleaseBlock(copy);
    return 0;
  }
  memcpy(copy, key, size);
  Entry** const head = Bucket(key);
  *entry = {copy, value, *head};
  *head = entry;
  ++table.entryCount;
  return value;
}

u32 cHashTableBase::Find(const char* key) const {
  Entry** link = Link(key ? key : "");
  return link && *link ? (*link)->value : 0;
}

u32 cHashTableBase::Unlink(Entry** link) {
  Entry* entry = *link;
  const u32 value = entry->value;
  *link = entry->next;
  ReleaseBlock(entry->key);
  ReleaseBlock(entry);
  --table.entryCount;
  return value;
}

u32 cHashTableBase::Remove(const char* key) {
  Entry** link = Link(key ? key : "");
  return link && *link ? Unlink(link) : 0;
}

u32 cHashTableBase::RemoveIfValue(const char* key, u32 value) {
  Entry** link = Link(key ? key : "");
  return link && *link && (*link)->value == value ? Unlink(link) : 0;
}

void cHashTableBase::Walk(WalkCallback callback) const {
  for (u32 i = 0; i < table.bucketCount; ++i) {
    Entry* next = nullptr;
    for (Entry* entry = table.buckets[i]; entry; entry = next) {
      next = entry->next;
      callback(entry->key, entry->value);
    }
  }
}

// An entry leaves the table before its element is deleted.
void cHashTableBase::ClearWith(Deleter deleter) {
  for (u32 i = 0; i < table.bucketCount; ++i)
    while (table.buckets[i]) {
      const u32 value = Unlink(&table.buckets[i]);
      if (deleter) deleter(value);
    }
}

void cHashTableBase::CheckLayout() {
  static_assert(offsetof(cHashTableBase, ownsElements) == 4, "fixed order");
  static_assert(offsetof(cHashTableBase, table) == 8, "fixed order");
  static_assert(sizeof(cHashTableBase) == 20 && sizeof(Table) == 12, "no gaps");
  static_assert(sizeof(Entry) == 12, "three words");
}
