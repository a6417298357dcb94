// SPDX-License-Identifier: MIT
#include "report/CallProfile.h"

#include <algorithm>
#include <cstdio>
#include <utility>
#include <vector>

namespace {

std::string Row(const std::string& name, const std::string& calls, CallProfile::Time time,
                CallProfile::Time total) {
  const double share = total.count() > 0 ? 100.0 * static_cast<double>(time.count()) /
                                               static_cast<double>(total.count())
                                         : 0;
  char row[160];
  std::snprintf(row, sizeof row, "%-24.60s %10s %12.3f %6.1f%%\n", name.c_str(), calls.c_str(),
                static_cast<double>(time.count()) / 1e6, share);
  return row;
}

}  // namespace

void CallProfile::AddCall(const std::string& function, Time time) {
  Entry& entry = functions[function];
  ++entry.calls;
  entry.time += time;
}

std::string CallProfile::Table() const {
  std::vector<std::pair<std::string, Entry>> sorted(functions.begin(), functions.end());
  std::sort(sorted.begin(), sorted.end(), [](const auto& one, const auto& other) {
    return one.second.time > other.second.time ||
           (one.second.time == other.second.time && one.first < other.first);
  });
  std::string table = "function                      calls           ms   share\n";
  Time inside{};
  for (const auto& [name, entry] : sorted) {
    table += Row(name, std::to_string(entry.calls), entry.time, total);
    inside += entry.time;
  }
  return table + Row("(macro and engine)", "", std::max(total - inside, Time{}), total);
}
