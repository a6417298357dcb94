// SPDX-License-Identifier: MIT
// Find and replace, plain and by regular expression.
//
// A search runs from the end of the selection (or the cursor) to the end of the text. Backward it
// runs from the start of the selection to the start of the text. With `wrap` it continues at the
// other end. A match is selected, so the next search starts after it. An empty match at the start
// of a search does not count, nor does one after the last line end.
#include <optional>

#include "document/Regex.h"
#include "functions/MacroCall.h"
#include "functions/groups/FunctionGroups.h"

namespace {

using Kind = ParameterKind;
using Match = Regex::Match;

// Finds matches in a document, whose text must not change meanwhile.
class Search {
 public:
  Search(const Document& searched, const Regex& expression)
      : document(searched), flat(searched.Flat()), regex(expression) {}

  std::optional<Match> Next(std::size_t from, bool notEmptyHere) const {
    std::optional<Match> match = regex.Find(flat.text, from, notEmptyHere);
    if (match && match->From() == flat.text.size() && flat.text.ends_with('\n')) match.reset();
    return match;
  }

  // The last match that begins before `limit`.
  std::optional<Match> LastBefore(std::size_t limit) const {
    std::optional<Match> last;
    for (std::optional<Match> match = Next(0, false); match && match->From() < limit;
         match = Next(match->To(), true))
      last = match;
    return last;
  }

  Range RangeOf(const Match& match) const {
    return {document.FromFlat(match.From()), document.FromFlat(match.To())};
  }

  const Document& document;
  const FlatText& flat;
  const Regex& regex;
};

// Runs `work` with the call's expression. The options are the parameter after `last`.
template <class Work>
MacroResult WithRegex(MacroCall& call, bool plain, std::size_t last, const Work& work) try {
  const auto words = call.Words(last + 1);
  const Regex regex(call.Text(0), {plain, words.contains("ignore_case"),
                                   words.contains("whole_word"), call.document().Flat().utf8});
  return work(regex, words);
} catch (const RegexError& error) {
  call.Fail(0, std::string("a valid regular expression (") + error.what() + ")");
}

std::optional<Match> FindMatch(const Document& document, const Regex& regex,
                               const std::set<std::string_view>& words) {
  const Search search(document, regex);
  const Range selection = document.Selection();
  const bool backward = words.contains("backward"), wrap = words.contains("wrap");
  std::optional<Match> match = backward ? search.LastBefore(document.FlatOffset(selection.from))
                                        : search.Next(document.FlatOffset(selection.to), true);
  if (match || !wrap) return match;
  return backward ? search.LastBefore(search.flat.text.size() + 1) : search.Next(0, false);
}

void Remember(MacroCall& call, const Match& match) {
  call.editor.lastMatch.clear();
  for (std::size_t i = 0; i < match.groups.size(); ++i) {
    std::optional<std::string> text;
    if (match.groups[i].first != std::string::npos)
      text = match.Group(call.document().Flat().text, i);
    call.editor.lastMatch.push_back(std::move(text));
  }
}

MacroResult Find(MacroCall& call, bool plain) {
  return WithRegex(call, plain, 0, [&](const Regex& regex, const auto& words) -> MacroResult {
    Document& document = call.document();
    const std::optional<Match> match = FindMatch(document, regex, words);
    if (!match) return 0;
    Remember(call, *match);
    document.Select(Search(document, regex).RangeOf(*match));
    return 1;
  });
}

std::string NewText(const MacroCall& call, const Search& search, const Match& match, bool plain) {
  if (plain) return call.Text(1);
  return search.regex.Expand(call.Text(1), search.flat.text, match);
}

MacroResult Replace(MacroCall& call, bool plain) {
  return WithRegex(call, plain, 1, [&](const Regex& regex, const auto& words) -> MacroResult {
    Document& document = call.document();
    const std::optional<Match> match = FindMatch(document, regex, words);
    if (!match) return 0;
    Remember(call, *match);
    const Search search(document, regex);
    const std::string text = NewText(call, search, *match, plain);
    document.Select(search.RangeOf(*match));
    document.Write(text);
    return 1;
  });
}

MacroResult ReplaceAll(MacroCall& call, bool plain) {
  return WithRegex(call, plain, 1, [&](const Regex& regex, const auto& words) -> MacroResult {
    Document& document = call.document();
    const Search search(document, regex);
    Range area = {{}, document.TextEnd()};
    if (words.contains("selection")) area = document.Selection();
    const std::size_t end = document.FlatOffset(area.to);
    std::vector<Replacement> replacements;
    for (std::optional<Match> match = search.Next(document.FlatOffset(area.from), false);
         match && match->To() <= end; match = search.Next(match->To(), true))
      replacements.push_back({search.RangeOf(*match), NewText(call, search, *match, plain)});
    document.Replace(replacements);
    return Answer(replacements.size());
  });
}

MacroResult MatchGroup(MacroCall& call) {
  const std::size_t group = call.Number(0), count = call.editor.lastMatch.size();
  if (group >= count)
    call.Fail(0,
              count == 0 ? "an earlier match" : "a group from 0 to " + std::to_string(count - 1));
  return call.editor.lastMatch[group].value_or("");
}

constexpr ResultKind kNumber = ResultKind::kNumber;
const MacroParameter kText = {"text", Kind::kName}, kPattern = {"pattern", Kind::kName};
const MacroParameter kReplacement = {"replacement", Kind::kText};
const MacroParameter kOptions = {
    "options", Kind::kWords, "none", {"ignore_case", "whole_word", "backward", "wrap"}};
const MacroParameter kAllOptions = {
    "options", Kind::kWords, "none", {"ignore_case", "whole_word", "selection"}};

const std::vector<MacroFunction> kFunctions = {
    {"find",
     {kText, kOptions},
     kNumber,
     "selects the next occurrence of a text; returns 1, or 0 if there is none",
     [](MacroCall& call) { return Find(call, true); }},
    {"find_regex",
     {kPattern, kOptions},
     kNumber,
     "selects the next match of a regular expression; returns 1, or 0 if there is none",
     [](MacroCall& call) { return Find(call, false); }},
    {"match_group",
     {{"group", Kind::kCount}},
     ResultKind::kText,
     "returns the text of a group of the last match; group 0 is the whole match",
     MatchGroup},
    {"replace",
     {kText, kReplacement, kOptions},
     kNumber,
     "replaces the next occurrence of a text; returns 1, or 0 if there is none",
     [](MacroCall& call) { return Replace(call, true); }},
    {"replace_regex",
     {kPattern, kReplacement, kOptions},
     kNumber,
     "replaces the next match of a regular expression; $1 or \\1 is a group, ${name} a named one; "
     "returns 1, or 0 if there is none",
     [](MacroCall& call) { return Replace(call, false); }},
    {"replace_all",
     {kText, kReplacement, kAllOptions},
     kNumber,
     "replaces every occurrence of a text; returns how many",
     [](MacroCall& call) { return ReplaceAll(call, true); }},
    {"replace_all_regex",
     {kPattern, kReplacement, kAllOptions},
     kNumber,
     "replaces every match of a regular expression, with groups as in replace_regex; returns how "
     "many",
     [](MacroCall& call) { return ReplaceAll(call, false); }},
};

}  // namespace

FunctionGroup FindGroup() { return {"Find and replace", kFunctions}; }
