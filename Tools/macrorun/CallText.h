// SPDX-License-Identifier: MIT
// The arguments and the result of a macro function call: kept, and as a text for people.
//
// Ownership: ArgumentCopies owns the texts that its list points to. Threading: one thread.
#pragma once

#include <span>
#include <string>
#include <vector>

#include "HostLink.h"
#include "MacroFunctions.h"

// The arguments of the call in progress, which a run nested into the call takes out of the record.
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

// `name(1, 2.5, "text")`, texts quoted as in JSON.
std::string CallText(const std::string& name, std::span<const HostArgument> arguments);
std::string ResultText(const MacroResult& result);
