// SPDX-License-Identifier: MIT
// cHashTable beside std::unordered_map; keys are the same in either case, and memory may be missing.
#include <ctype.h>

#include <algorithm>
#include <unordered_map>
#include <vector>

#include "Model.h"
#include "cLib/cHashTable.h"

namespace {

Element* ElementOf(u32 value) { return reinterpret_cast<Element*>(value); }
u32 ValueOf(const Element* element) {
  return static_cast<u32>(reinterpret_cast<uintptr_t>(element));
}

class Pair {
 public:
  explicit Pair(bool owns) : owned(owns) { real.SetOwnsElements(owns); }

  void Step(Input& input) {
    const std::string key = AnyText(input, 3);
    std::string small = key;
    for (char& ch : small) ch = static_cast<char>(tolower(static_cast<u8>(ch)));
    const char* const given = key.empty() && input.ConsumeBool() ? nullptr : key.c_str();
    const auto entry = model.find(small);
    const u32 old = entry == model.end() ? 0 : entry->second;
    CHECK(real.Find(given) == old);
    switch (Below(input, 4)) {
      case 0:
        CHECK(real.Remove(given) == old);
        Forget(small, old);
        break;
      case 1: {
        const u32 value = input.ConsumeBool() ? old : 1;  // 1: in no entry
        CHECK(real.RemoveIfValue(given, value) == (value == old ? old : 0));
        if (value == old) Forget(small, old);
        break;
      }
      default:
        Insert(given, small, old, Below(input, 5));
    }
    CHECK(real.EntryCount() == model.size() && Element::live == static_cast<int>(model.size()));
  }

  // The elements of a table that does not own them are still there after it.
  void Finish() {
    static std::vector<u32> walked;
    static cHashTable<Element>* table;
    walked.clear(), table = &real;
    std::vector<u32> values;
    for (const auto& [key, value] : model) values.push_back(value);
    const bool removes = owned && model.size() % 2;
    real.Walk(removes ? [](const char* key, u32) { walked.push_back(table->Remove(key)); }
                      : [](const char*, u32 value) { walked.push_back(value); });
    CHECK(std::ranges::is_permutation(walked, values));
    CHECK(real.EntryCount() == (removes ? 0 : model.size()));
    const bool deletes = owned && !removes;
    if (model.size() % 4 < 2) {  // else its destructor clears it
      real.Clear();
      CHECK(real.EntryCount() == 0);
      CHECK(Element::live == static_cast<int>(deletes ? 0 : values.size()));
    }
    for (const u32 value : values)
      if (!deletes) delete ElementOf(value);
  }

 private:
  // An entry and its key are two allocations; the `failing`-th of them fails.
  void Insert(const char* given, const std::string& small, u32 old, u32 failing) {
    Element* const element = new Element;
    FailAllocation(static_cast<int>(failing));
    const u32 result = real.Insert(given, ValueOf(element));
    if (FailAllocation(0)) {
      CHECK(result == 0 && real.Find(given) == old);
      return delete element;
    }
    CHECK(result == (old ? old : ValueOf(element)));
    delete ElementOf(old);
    model[small] = ValueOf(element);
  }

  void Forget(const std::string& small, u32 old) {
    delete ElementOf(old);
    model.erase(small);
  }

  const bool owned;
  cHashTable<Element> real;
  std::unordered_map<std::string, u32> model;
};

}  // namespace

size_t HashTableModel(Input& input) {
  Pair pair(input.ConsumeBool());
  size_t steps = 0;
  for (; input.remaining_bytes(); ++steps) pair.Step(input);
  pair.Finish();
  return steps;
}
