// SPDX-License-Identifier: MIT
// Copies of a call's arguments. A nested run empties the record of the call that started it.
//
// Ownership: the object owns the texts that its list points to. Threading: one thread.
#pragma once

#include <string>
#include <vector>

#include "host/HostLink.h"

class ArgumentCopies {
 public:
  explicit ArgumentCopies(HostLink* link);
  ArgumentCopies(const ArgumentCopies&) = delete;
  ArgumentCopies& operator=(const ArgumentCopies&) = delete;

  const std::vector<HostArgument>& List() const { return list; }

 private:
  std::vector<std::string> texts;
  std::vector<HostArgument> list;
};
