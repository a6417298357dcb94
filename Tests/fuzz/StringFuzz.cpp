// SPDX-License-Identifier: MIT
// String beside std::string. A text argument may stand in the string's own buffer.
#include <algorithm>

#include "Fuzz.h"

static constexpr size_t kLongest = 6000;  // of the string
static const char kBlanks[] = " \t";

static bool IsBlank(char ch) { return ch == ' ' || ch == '\t'; }

// Replaces the first occurrence at or behind `from`.
static bool Replace(std::string& model, const std::string& needle, const std::string& by,
                    size_t from = 0) {
  const size_t at = model.find(needle, from);
  if (at == std::string::npos) return false;
  model.replace(at, needle.size(), by);
  return true;
}

namespace {
class Pair {
 public:
  explicit Pair(Input& bytes) : input(bytes) {}

  void Step() {
    // The argument as a text of its own, or as a part of the string.
    const size_t from = input.ConsumeIntegralInRange<size_t>(0, 1000);
    const bool own = input.ConsumeBool() && from <= model.size();
    const std::string argument = own ? model.substr(from) : AnyText(input);
    Edit(own ? real.Text() + from : argument.c_str(), argument);
    CHECK(BytesOf(real) == model);
    CHECK(real.Length() < real.Capacity() && real.Text()[real.Length()] == 0);
    Compare(argument);
    if (model.size() > kLongest) real.Assign(""), model.clear();
  }

 private:
  void Edit(const char* s, const std::string& argument) {
    const int place = AnyPlace(input, model.size());
    const size_t at = static_cast<size_t>(place);
    const u32 count = input.ConsumeIntegralInRange<u32>(0, 20);
    const char ch = input.ConsumeIntegralInRange<char>(1, 127);
    const bool inside = place >= 0 && (at < model.size() || at == 0);
    switch (input.ConsumeIntegralInRange(0, 18)) {
      case 0:
        return real.Assign(s), void(model = argument);
      case 1:
        return real.Append(s), void(model += argument);
      case 2:
        return real.AppendChar(ch), void(model += ch);
      case 3:
        real.InsertChar(ch, place);
        if (place >= 0 && at <= model.size()) model.insert(at, 1, ch);
        return;
      case 4:
        real.Insert(s, place);
        if (inside) model.insert(at, argument);
        return;
      case 5:
        real.Delete(place, count);
        if (inside) model.erase(at, count);
        return;
      case 6:
        CHECK(BytesOf(real.Mid(place, count)) == (inside ? model.substr(at, count) : ""));
        CHECK(BytesOf(real.MidFrom(place)) == (inside ? model.substr(at) : ""));
        return;
      case 7:
        if (place == INT32_MAX) return;
        if (place >= 0 && at >= model.size()) model.resize(at + 1, ' ');
        real.SetAt(place, ch);
        if (place >= 0) model[at] = ch;
        return;
      case 8: {
        const std::string by = AnyText(input);
        const bool tried = !model.empty() && argument != by;
        const bool done = real.Substitute(s, by.c_str());
        CHECK(done == (tried && Replace(model, argument, by)));
        return;
      }
      case 9: {
        const std::string by = AnyText(input, 8);
        u32 times = 0;
        for (size_t i = 0; !argument.empty() && (i = model.find(argument, i)) != std::string::npos;
             i += by.size(), ++times)
          model.replace(i, argument.size(), by);
        CHECK(real.ReplaceAll(s, by.c_str()) == times);
        return;
      }
      case 10: {
        const bool tried = count < model.size() && !argument.empty();
        const bool done = real.ReplaceFirstWithChar(s, ch, count);
        CHECK(done == (tried && Replace(model, argument, std::string(1, ch), count)));
        return;
      }
      case 11:
        model.erase(0, std::min(model.find_first_not_of(kBlanks), model.size()));
        model.erase(model.find_last_not_of(kBlanks) + 1);
        return real.Trim();
      case 12:
        model.erase(std::unique(model.begin(), model.end(),
                                [](char a, char b) { return IsBlank(a) && IsBlank(b); }),
                    model.end());
        return real.CollapseBlanks();
      case 13:
        std::erase_if(model, [](char c) { return static_cast<signed char>(c) < 32; });
        return real.RemoveControlChars();
      case 14:
        return void(real.Reserve(count));
      case 15:
        real.Format("%d:%s", place, s);
        model = std::to_string(place) + ":" + argument;
        if (model.size() >= 4096) model = "%d:%s....";
        return;
      case 16:
        for (char& c : model) c = c == ch ? c : static_cast<char>(c ^ ch);
        return real.XorChars(static_cast<u8>(ch));
      case 17: {
        std::string wide;
        for (const char c : argument) {
          const u8 byte = static_cast<u8>(c);
          if (byte >= 128) wide += static_cast<char>(0xC0 + byte / 64);
          wide += static_cast<char>(byte < 128 ? byte : 0x80 + byte % 64);
        }
        real.FromLatin1ToUtf8(s);
        return void(model = wide);
      }
      default: {
        const String copy(real);
        real = copy;
        CHECK(BytesOf(copy + s) == model + argument);
      }
    }
  }

  void Compare(const std::string& argument) const {
    const String other(argument.c_str());
    const int order = model.compare(argument);
    CHECK(real.Compare(&other, true, false) == (order > 0) - (order < 0));
    CHECK((real.Compare(&other, true, true) == 0) == model.starts_with(argument));
    CHECK(real.Equals(argument.c_str(), true) == (model == argument));
    CHECK(real.EndsWith(argument.c_str(), true) ==
          (!argument.empty() && model.ends_with(argument)));
    const size_t last = argument.empty() ? std::string::npos : model.rfind(argument);
    CHECK(real.FindReverse(argument.c_str(), 0, true) == static_cast<int>(last));
    CHECK(real.SkipBlanks() == std::min(model.find_first_not_of(kBlanks), model.size()));
  }

  Input& input;
  String real;
  std::string model;
};
}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* bytes, size_t size) {
  Input input(bytes, size);
  Pair pair(input);
  while (input.remaining_bytes()) pair.Step();
  return 0;
}
