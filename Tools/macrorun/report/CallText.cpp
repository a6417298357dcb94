// SPDX-License-Identifier: MIT
#include "report/CallText.h"

#include <nlohmann/json.hpp>

namespace {

std::string Quoted(const std::string& text) {
  return nlohmann::json(text).dump(-1, ' ', false, nlohmann::json::error_handler_t::replace);
}

}  // namespace

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
