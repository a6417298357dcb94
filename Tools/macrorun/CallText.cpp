// SPDX-License-Identifier: MIT
#include "CallText.h"

#include <nlohmann/json.hpp>

namespace {

std::string Quoted(const std::string& text) {
  return nlohmann::json(text).dump(-1, ' ', false, nlohmann::json::error_handler_t::replace);
}

}  // namespace

ArgumentCopies::ArgumentCopies(HostLink* link) {
  const std::uint32_t count = HostLinkArgumentCount(link);
  texts.reserve(count);  // the list points into it
  for (std::uint32_t i = 0; i < count; ++i) {
    HostArgument argument = HostLinkArgument(link, i);
    texts.emplace_back(argument.text);
    argument.text = texts.back().c_str();
    list.push_back(argument);
  }
}

std::string CallText(const std::string& name, std::span<const HostArgument> arguments) {
  std::string text = name + "(";
  for (const HostArgument& argument : arguments) {
    if (text.back() != '(') text += ", ";
    text += argument.kind == kTextArgument ? Quoted(argument.text) : argument.text;
  }
  return text + ")";
}

std::string ResultText(const MacroResult& result) {
  if (const std::string* text = std::get_if<std::string>(&result)) return Quoted(*text);
  return std::to_string(std::get<std::int32_t>(result));
}
