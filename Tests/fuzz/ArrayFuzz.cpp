// SPDX-License-Identifier: MIT
// Array, with and without ownership, beside std::vector.
#include <vector>

#include "Fuzz.h"
#include "cLib/cArray.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* bytes, size_t size) {
  {
    Input input(bytes, size);
    Array<Element> real;
    std::vector<Element*> model;
    const auto forget = [&](size_t at) {
      Element* const element = at < model.size() ? model[at] : nullptr;
      if (element) model[at] = nullptr;
      return element;
    };
    while (input.remaining_bytes()) {
      const int place = AnyPlace(input, model.size());
      const size_t at = static_cast<size_t>(place);
      switch (input.ConsumeIntegralInRange(0, 5)) {
        case 0:
        case 1: {
          if (place == INT32_MAX) break;
          Element* const element = input.ConsumeIntegralInRange(0, 7) ? new Element : nullptr;
          CHECK(real.SetAt(element, place) == place);
          if (place < 0) {
            delete element;
          } else {
            if (at >= model.size()) model.resize(at + 1);
            model[at] = element;
          }
          break;
        }
        case 2: {
          Element* const element = real.Detach(place);
          CHECK(element == (place < 0 ? nullptr : forget(at)));
          delete element;
          break;
        }
        case 3: {
          const u32 before = real.Capacity();
          const int slots = input.ConsumeIntegralInRange(-2, 100);
          real.Grow(slots);
          CHECK(real.Capacity() == before + (slots > 0 ? static_cast<u32>(slots) : 0));
          break;
        }
        case 4: {
          const size_t kept = input.ConsumeIntegralInRange<size_t>(0, model.size());
          real.Truncate(static_cast<int>(kept)), model.resize(kept);
          break;
        }
        default:
          // Not owning, its elements are somebody else's.
          real.SetOwnsElements(false);
          real.Clear();
          for (Element* element : model) delete element;
          model.clear();
          real.SetOwnsElements(true);
      }
      CHECK(real.Count() == static_cast<int>(model.size()));
      CHECK(real.Capacity() >= model.size());
      CHECK(real.At(place) == (place >= 0 && at < model.size() ? model[at] : nullptr));
      for (size_t i = 0; i < model.size(); ++i) CHECK(real.At(static_cast<int>(i)) == model[i]);
    }
  }
  CHECK(Element::live == 0);
  return 0;
}
