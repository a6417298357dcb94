// SPDX-License-Identifier: MIT
// StringTokenizer beside a plain reading of its rules.
#include <optional>

#include "Fuzz.h"
#include "cLib/StringTokenizer.h"

namespace {
struct Model {
  std::string text, delimiters;
  char quote;
  size_t at = 0;
  bool over = false;

  bool Delimits(char ch) const { return delimiters.find(ch) != std::string::npos; }

  std::optional<std::string> Next(bool keepEmpty) {
    if (over) return std::nullopt;
    while (!keepEmpty && at < text.size() && Delimits(text[at])) ++at;
    if (!keepEmpty && at == text.size()) over = true;
    if (over) return std::nullopt;
    std::string token;
    for (bool quoted = false;; ++at) {
      if (at == text.size()) return over = true, token;
      const char ch = text[at];
      if (quote && ch == quote) {
        const bool doubled = quoted && at + 1 < text.size() && text[at + 1] == quote;
        if (doubled)
          token += text[at++];
        else
          quoted = !quoted;
      } else if (!quoted && Delimits(ch)) {
        return ++at, token;
      } else {
        token += ch;
      }
    }
  }
};
}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* bytes, size_t size) {
  Input input(bytes, size);
  const char quote = input.ConsumeIntegralInRange<char>(0, 127);
  const std::string delimiters = AnyText(input, 5), text = AnyText(input, 500);
  StringTokenizer real(text.c_str(), delimiters.c_str());
  real.SetQuote(quote);
  Model model = {text, delimiters, quote};
  for (bool more = true; more;) {
    const bool keepEmpty = input.ConsumeBool();
    const std::optional<std::string> token = model.Next(keepEmpty);
    more = real.NextToken(keepEmpty);
    CHECK(more == token.has_value());
    if (more) CHECK(BytesOf(real.Token()) == *token);
  }
  return 0;
}
