// SPDX-License-Identifier: MIT
#include "host/ArgumentCopies.h"

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
