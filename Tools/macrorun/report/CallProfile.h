// SPDX-License-Identifier: MIT
// Counts and times the calls of a macro's functions.
//
// Units: nanoseconds inside, milliseconds in the table. Time in a macro that another one runs counts
// for the call that runs it. Threading: one thread.
#pragma once

#include <chrono>
#include <map>
#include <string>

class CallProfile {
 public:
  using Time = std::chrono::nanoseconds;

  void AddCall(const std::string& function, Time time);
  void AddRun(Time time) { total += time; }

  // A head line and one for each function, the longest time first; the last is for what the macro
  // itself and its engine took.
  std::string Table() const;

 private:
  struct Entry {
    long long calls = 0;
    Time time{};
  };
  std::map<std::string, Entry> functions;
  Time total{};
};
