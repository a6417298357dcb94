// SPDX-License-Identifier: MIT
// Array, with and without ownership, beside std::vector.
#include <vector>

#include "Model.h"
#include "cLib/cArray.h"

size_t ArrayModel(Input& input) {
  Array<Element> real;
  std::vector<Element*> model;
  size_t steps = 0;
  for (; input.remaining_bytes(); ++steps) {
    const int place = AnyPlace(input, model.size());
    const size_t at = static_cast<size_t>(place);
    const bool isThere = place >= 0 && at < model.size();
    switch (Below(input, 7)) {
      case 0:
      case 1:
      case 2: {
        if (place == INT32_MAX) break;
        Element* const element = Below(input, 8) ? new Element : nullptr;
        CHECK(real.SetAt(element, place) == place);
        if (place < 0) {
          delete element;
          break;
        }
        if (!isThere) model.resize(at + 1);
        model[at] = element;
        break;
      }
      case 3: {
        Element* const element = real.Detach(place);
        CHECK(element == (isThere ? model[at] : nullptr));
        if (isThere) model[at] = nullptr;
        delete element;
        break;
      }
      case 4: {
        const u32 before = real.Capacity();
        const int slots = static_cast<int>(Below(input, 100)) - 2;
        real.Grow(slots);
        CHECK(real.Capacity() == before + (slots > 0 ? static_cast<u32>(slots) : 0));
        break;
      }
      case 5: {
        const u32 kept = Below(input, static_cast<u32>(model.size()) + 1);
        real.Truncate(static_cast<int>(kept)), model.resize(kept);
        break;
      }
      default:
        if (Below(input, 8)) break;
        // Not owning, its elements are somebody else's.
        real.SetOwnsElements(false);
        real.Clear();
        for (Element* element : model) delete element;
        model.clear();
        real.SetOwnsElements(true);
    }
    CHECK(real.Count() == static_cast<int>(model.size()) && real.Capacity() >= model.size());
    CHECK(real.At(place) == (place >= 0 && at < model.size() ? model[at] : nullptr));
    int live = 0;
    for (size_t i = 0; i < model.size(); live += model[i++] != nullptr)
      CHECK(real.At(static_cast<int>(i)) == model[i]);
    CHECK(Element::live == live);
  }
  return steps;
}
