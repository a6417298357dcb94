// SPDX-License-Identifier: MIT
// Counts and times the calls of a macro's functions.
//
// Units: nanoseconds, in the table milliseconds. The time of a nested macro counts for the call of
// run_macro. Threading: one thread.
#pragma once

#include <chrono>
#include <map>
#include <string>

class CallProfile {
 public:
  using Time = std::chrono::nanoseconds;

  void AddCall(const std::string& function, Time time);
  void AddRun(Time time) { total += time; }

  // A heading, a line for each function, the longest time first, and a line for the macro and its
  // engine.
  std::string Table() const;

 private:
  struct Entry {
    long long calls = 0;
    Time time{};
  };
  std::map<std::string, Entry> functions;
  Time total{};
};
