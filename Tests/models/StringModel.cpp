// SPDX-License-Identifier: MIT
// Compares String with std::string. A text argument may point into the string's own buffer, the
// string may hold zero bytes, and an allocation may fail: the string is then unchanged or correct.
#include <string.h>

#include <algorithm>
#include <memory>

#include "Model.h"

namespace {

constexpr size_t kLongest = 6000;  // of the string
constexpr char kBlanks[] = " \t";

bool IsBlank(char ch) { return ch == ' ' || ch == '\t'; }

std::string Cut(const std::string& text) { return text.c_str(); }  // at its first zero byte

// Replaces up to `most` occurrences from `from` on, and returns how many.
u32 Replace(std::string& text, size_t from, const std::string& needle, const std::string& with,
            u32 most) {
  u32 count = 0;
  for (size_t at; count < most; ++count, from += at + with.size()) {
    at = Cut(text.substr(from)).find(needle);
    if (at == std::string::npos) break;
    text = Cut(text.replace(from + at, needle.size(), with));
  }
  return count;
}

class Pair {
 public:
  explicit Pair(Input& bytes) : input(bytes) {}

  void Step() {
    // A new one now and then: the old one's block has grown so large that all fits in.
    if (model.size() > kLongest || Below(input, 64) == 0) Renew();
    // The argument is a separate text or a part of the string.
    const size_t from = Below(input, 1024) % (model.size() + 1);
    const bool own = input.ConsumeBool();
    const std::string given = own ? Cut(model.substr(from)) : AnyText(input), before = model;
    FailAllocation(Below(input, 9) ? 0 : 1);
    u32 answer = 0;
    const bool isRight = Change(own ? real.Text() + from : given.c_str(), given, answer);
    const bool failed = FailAllocation(0);
    if (failed && Bytes(real) == before) model = before;
    CHECK(isRight || (failed && answer == 0));
    CHECK(Bytes(real) == model);
    CHECK(real.Length() < real.Capacity() && real.Text()[real.Length()] == 0);
    if (IsPlain()) Compare(given);
  }

 private:
  // Even the first block may be missing, which makes an empty string.
  void Renew() {
    const std::string text = AnyText(input);
    const bool fails = Below(input, 8) == 0;
    std::destroy_at(&real);
    FailAllocation(fails ? 1 : 0);
    std::construct_at(&real, text.c_str());
    FailAllocation(0);
    model = fails ? "" : text;
  }

  bool IsPlain() const { return strlen(model.c_str()) == model.size(); }

  // Whether the answer is that of the model; without memory it is 0.
  bool Change(const char* s, const std::string& given, u32& answer) {
    const int place = AnyPlace(input, model.size());
    const size_t at = static_cast<u32>(place), size = model.size();
    const bool inside = at < size || place == 0;
    const u32 count = Below(input, 16) ? Below(input, 20) : UINT32_MAX;
    const char ch = Below(input, 9) ? AnyCharacter(input) : '\0';
    switch (Below(input, 19)) {
      case 0:
        return real.Assign(s), model = given, true;
      case 1:
        return real.Append(s), model += given, true;
      case 2:
        return real.AppendChar(ch), model += ch, true;
      case 3:
        real.InsertChar(ch, place);
        if (at <= size) model.insert(at, 1, ch), model.resize(size + (ch != 0));
        return true;
      case 4:
        real.Insert(s, place);
        if (inside && !given.empty()) model = Cut(model.insert(at, given));
        return true;
      case 5:
        real.Delete(place, count);
        if (inside) model = Cut(model.erase(at, count));
        return true;
      case 6:
        return Bytes(real.Mid(place, count)) == (inside ? Cut(model.substr(at, count)) : "") &&
               Bytes(real.MidFrom(place)) == (inside ? Cut(model.substr(at)) : "");
      case 7:
        real.SetAt(place, ch);
        if (place < 0 || place == INT32_MAX) return true;
        if (at >= size) model.resize(at + 1, ' ');
        return model[at] = ch, true;
      case 8: {
        const std::string by = AnyText(input, 4);
        const bool tried = size && given != by;
        answer = real.Substitute(s, by.c_str());
        if (tried) model = Cut(model);
        return answer == Replace(model, 0, given, by, tried);
      }
      case 9: {
        const std::string by = AnyText(input, 4);
        answer = real.ReplaceAll(s, by.c_str());
        if (given.empty()) return answer == 0;
        model = Cut(model);
        return answer == Replace(model, 0, given, by, UINT32_MAX);
      }
      case 10: {
        const u32 most = at < size && !given.empty();
        answer = real.ReplaceFirstWithChar(s, ch, static_cast<u32>(place));
        return answer == Replace(model, at, given, std::string(1, ch), most);
      }
      case 11:
        return Edit([&] { real.Trim(); }, [&] {
          model.erase(0, std::min(model.find_first_not_of(kBlanks), size));
          model.erase(model.find_last_not_of(kBlanks) + 1);
        });
      case 12:
        return Edit([&] { real.CollapseBlanks(); }, [&] {
          const auto isRun = [](char a, char b) { return IsBlank(a) && IsBlank(b); };
          model.erase(std::unique(model.begin(), model.end(), isRun), model.end());
        });
      case 13:
        return Edit([&] { real.RemoveControlChars(); }, [&] {
          std::erase_if(model, [](char c) { return static_cast<signed char>(c) < 32; });
        });
      case 14:
        return answer = real.Reserve(count % 60 + 1), answer == 1;
      case 15:
        real.Format("%d:%s|%s", place, s, real.Text());
        model = std::to_string(place) + ":" + given + "|" + Cut(model);
        if (model.size() >= 4096) model = "%d:%s|%s....";
        return true;
      case 16:
        return Edit([&] { real.XorChars(static_cast<u8>(ch)); }, [&] {
          for (char& c : model) c = c == ch ? c : static_cast<char>(c ^ ch);
        });
      case 17:
        return Bytes(String(real)) == model;
      default:
        real.FromLatin1ToUtf8(s);
        model.clear();
        for (const char c : given) {
          const u8 byte = static_cast<u8>(c);
          if (byte >= 128) model += static_cast<char>(0xC0 + byte / 64);
          model += static_cast<char>(byte < 128 ? byte : 0x80 + byte % 64);
        }
        return true;
    }
  }

  // The result of an edit of a text with zero bytes is not specified.
  template <class Real, class Model>
  bool Edit(Real editReal, Model editModel) {
    const bool plain = IsPlain();
    editReal();
    if (plain)
      editModel();
    else
      model = Bytes(real);
    return true;
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

size_t StringModel(Input& input) {
  Pair pair(input);
  size_t steps = 0;
  for (; input.remaining_bytes(); ++steps) pair.Step();
  return steps;
}
