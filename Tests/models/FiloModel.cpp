// SPDX-License-Identifier: MIT
// FIFO and Stack beside std::deque and std::vector.
#include <algorithm>
#include <deque>
#include <vector>

#include "Model.h"
#include "cLib/cFilo.h"

namespace {

Element* AnyElement(Input& input) { return Below(input, 8) ? new Element : nullptr; }

class FifoPair {
 public:
  explicit FifoPair(u32 slots) : real(static_cast<int>(slots)), model(slots) {}

  void Step(Input& input) {
    const int place = AnyPlace(input, model.size());
    const size_t at = static_cast<size_t>(place);
    const bool isThere = place >= 0 && at < model.size();
    switch (Below(input, 4)) {
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

  long Compare() const {
    CHECK(real.Size() == model.size());
    for (size_t i = 0; i < model.size(); ++i) CHECK(real.At(static_cast<int>(i)) == model[i]);
    CHECK(!real.At(static_cast<int>(model.size())) && !real.At(-1));
    return static_cast<long>(model.size()) - std::ranges::count(model, nullptr);
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
    if (Below(input, 3)) {
      model.push_back(AnyElement(input));
      CHECK(real.Push(model.back()));
    } else if (Below(input, 16)) {
      CHECK(real.Pop() == top);
      if (!model.empty()) model.pop_back();
      delete top;
    } else {
      real.Clear();
      model.clear();
    }
  }

  long Compare() const {
    CHECK(real.Depth() == static_cast<int>(model.size()));
    return static_cast<long>(model.size()) - std::ranges::count(model, nullptr);
  }

 private:
  Stack<Element> real;
  std::vector<Element*> model;
};

}  // namespace

size_t FiloModel(Input& input) {
  FifoPair fifo(Below(input, 10));
  StackPair stack;
  size_t steps = 0;
  for (; input.remaining_bytes(); ++steps) {
    if (input.ConsumeBool())
      fifo.Step(input);
    else
      stack.Step(input);
    CHECK(fifo.Compare() + stack.Compare() == Element::live);
  }
  return steps;
}
