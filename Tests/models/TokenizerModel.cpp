// SPDX-License-Identifier: MIT
// StringTokenizer beside a plain reading of its rules.
#include <optional>

#include "Model.h"
#include "cLib/StringTokenizer.h"

namespace {

struct Rules {
  std::string text, delimiters;
  char quote;
  size_t at = 0;
  bool over = false, found = false;
  char last = '\0';

  // Whether a delimiter stands here; it is passed.
  bool Passes() {
    const bool stands = at < text.size() && delimiters.find(text[at]) != std::string::npos;
    if (stands) last = text[at++], found = true;
    return stands;
  }

  std::optional<std::string> Next(bool keepEmpty) {
    found = false;
    if (over) return std::nullopt;
    while (!keepEmpty && Passes()) {
    }
    if (!keepEmpty && at == text.size()) return over = true, std::nullopt;
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
      } else if (!quoted && Passes()) {
        return token;
      } else {
        token += ch;
      }
    }
  }
};

}  // namespace

size_t TokenizerModel(Input& input) {
  const char quote = input.ConsumeBool() ? AnyCharacter(input) : '\0';
  const std::string delimiters = AnyText(input, 5), text = AnyText(input, 500);
  StringTokenizer real(text.c_str(), delimiters.c_str());
  real.SetQuote(quote);
  CHECK(real.HasManyDelimiters() == (delimiters.size() > 1));
  Rules model = {text, delimiters, quote};
  for (size_t steps = 1;; ++steps) {
    const bool keepEmpty = input.ConsumeBool();
    const std::optional<std::string> token = model.Next(keepEmpty);
    CHECK(real.NextToken(keepEmpty) == token.has_value());
    CHECK(real.FoundDelimiter() == model.found && real.LastDelimiter() == model.last);
    if (!token) {
      CHECK(!real.NextToken(true));
      return steps;
    }
    CHECK(Bytes(real.Token()) == *token);
  }
}
