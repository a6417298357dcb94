// SPDX-License-Identifier: MIT
// cHashTable with numbers beside std::unordered_map; keys are the same in either case.
#include <ctype.h>

#include <unordered_map>

#include "Fuzz.h"
#include "cLib/cHashTable.h"

static u32 walked;

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* bytes, size_t size) {
  Input input(bytes, size);
  cHashTable<String> real;
  real.SetOwnsElements(false);
  std::unordered_map<std::string, u32> model;
  while (input.remaining_bytes()) {
    const std::string key = AnyText(input, 20);
    std::string small = key;
    for (char& ch : small) ch = static_cast<char>(tolower(static_cast<u8>(ch)));
    const char* const given = key.empty() && input.ConsumeBool() ? nullptr : key.c_str();
    const auto entry = model.find(small);
    const u32 old = entry == model.end() ? 0 : entry->second;
    CHECK(real.Find(given) == old);
    const u32 value = input.ConsumeIntegralInRange<u32>(1, 5);
    switch (input.ConsumeIntegralInRange(0, 4)) {
      case 0:
        CHECK(real.Remove(given) == old);
        model.erase(small);
        break;
      case 1:
        CHECK(real.RemoveIfValue(given, value) == (old == value ? value : 0));
        if (old == value) model.erase(small);
        break;
      default:
        CHECK(real.Insert(given, value) == (old ? old : value));
        model[small] = value;
    }
    CHECK(real.EntryCount() == model.size());
  }
  u32 sum = walked = 0;
  for (const auto& [key, value] : model) sum += value;
  real.Walk([](const char*, u32 value) { walked += value; });
  CHECK(walked == sum);
  real.Clear();
  CHECK(real.EntryCount() == 0);
  return 0;
}
