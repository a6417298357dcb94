// SPDX-License-Identifier: MIT
// FIFO and Stack beside std::deque and std::vector.
#include <algorithm>
#include <deque>
#include <vector>

#include "Fuzz.h"
#include "cLib/cFilo.h"

namespace {
Element* AnyElement(Input& input) {
  return input.ConsumeIntegralInRange(0, 7) ? new Element : nullptr;
}

class FifoPair {
 public:
  explicit FifoPair(int slots) : real(slots), model(static_cast<size_t>(slots)) {}

  void Step(Input& input) {
    const int place = AnyPlace(input, model.size());
    const size_t at = static_cast<size_t>(place);
    const bool isThere = place >= 0 && at < model.size();
    switch (input.ConsumeIntegralInRange(0, 3)) {
      case 0: {
        // The one that is about to fall off may come back in front.
        const bool again = !model.empty() && input.ConsumeBool();
        Element* const element = again ? model.back() : AnyElement(input);
        CHECK(real.Push(element) == !model.empty());
        if (model.empty()) return delete element;
        model.push_front(element);
        return model.pop_back();
      }
      case 1: {
        Element* const element = AnyElement(input);
        CHECK(real.SetAt(element, place) == isThere);
        if (!isThere) return delete element;
        model[at] = element;
        return;
      }
      case 2:
        // What stands there already stays.
        if (isThere) CHECK(real.SetAt(model[at], place));
        return;
      default:
        real.RemoveAt(place);
        if (!isThere) return;
        model.erase(model.begin() + place);
        model.push_back(nullptr);
    }
  }

  int Compare() const {
    CHECK(real.Size() == model.size());
    for (size_t i = 0; i < model.size(); ++i) CHECK(real.At(static_cast<int>(i)) == model[i]);
    CHECK(!real.At(static_cast<int>(model.size())) && !real.At(-1));
    return static_cast<int>(model.size() - std::ranges::count(model, nullptr));
  }

 private:
  FIFO<Element> real;
  std::deque<Element*> model;
};

class StackPair {
 public:
  void Step(Input& input) {
    Element* const top = model.empty() ? nullptr : model.back();
    CHECK(real.Top() == top);
    if (input.ConsumeIntegralInRange(0, 2)) {
      model.push_back(AnyElement(input));
      CHECK(real.Push(model.back()));
    } else if (input.ConsumeIntegralInRange(0, 15)) {
      CHECK(real.Pop() == top);
      if (!model.empty()) model.pop_back();
      delete top;
    } else {
      real.Clear();
      model.clear();
    }
  }

  int Compare() const {
    CHECK(real.Depth() == static_cast<int>(model.size()));
    return static_cast<int>(model.size() - std::ranges::count(model, nullptr));
  }

 private:
  Stack<Element> real;
  std::vector<Element*> model;
};
}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* bytes, size_t size) {
  {
    Input input(bytes, size);
    FifoPair fifo(input.ConsumeIntegralInRange(0, 9));
    StackPair stack;
    while (input.remaining_bytes()) {
      if (input.ConsumeBool())
        fifo.Step(input);
      else
        stack.Step(input);
      CHECK(fifo.Compare() + stack.Compare() == Element::live);
    }
  }
  CHECK(Element::live == 0);
  return 0;
}
