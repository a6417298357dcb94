// SPDX-License-Identifier: MIT
#include "Comparison.h"

#include <windows.h>

#include <algorithm>
#include <cstdio>

namespace {

std::string Time(double seconds) {
  char text[32];
  const bool small = seconds < 1e-3 && seconds > -1e-3;
  std::snprintf(text, sizeof text, small ? "%.3f us" : "%.2f ms", seconds * (small ? 1e6 : 1e3));
  return text;
}

std::string Ratio(double ratio) {
  char text[32];
  std::snprintf(text, sizeof text, "%.2fx", ratio);
  return text;
}

// "median (least..greatest)"
std::string Spread(const std::vector<double>& values, std::string (*format)(double)) {
  const auto [least, greatest] = std::minmax_element(values.begin(), values.end());
  return format(Median(values)) + " (" + format(*least) + ".." + format(*greatest) + ")";
}

}  // namespace

double Now() {
  LARGE_INTEGER frequency;
  LARGE_INTEGER count;
  QueryPerformanceFrequency(&frequency);
  QueryPerformanceCounter(&count);
  return static_cast<double>(count.QuadPart) / static_cast<double>(frequency.QuadPart);
}

double Median(std::vector<double> values) {
  std::sort(values.begin(), values.end());
  const std::size_t half = values.size() / 2;
  return values.size() % 2 ? values[half] : (values[half - 1] + values[half]) / 2;
}

void PrintHead() {
  std::printf("%-34s %10s %10s   %-21s %s\n", "medians (least..greatest)", "time", "peer's",
              "ratio", "goal");
}

void Comparison::Print() const {
  std::vector<double> times;
  std::vector<double> peers;
  std::vector<double> ratios;
  std::vector<double> differences;
  for (const Round& round : rounds) {
    times.push_back(round.time);
    peers.push_back(round.peer);
    ratios.push_back(round.time / round.peer);
    differences.push_back(round.time - round.peer);
  }
  const bool isRatio = measure == Measure::kRatio;
  const bool met = Median(isRatio ? ratios : differences) <= goal;
  const std::string goalText =
      isRatio ? Ratio(goal) : Time(goal) + " more, is " + Spread(differences, Time);
  std::printf("%-34s %10s %10s   %-21s %s %s\n", name.c_str(), Time(Median(times)).c_str(),
              Time(Median(peers)).c_str(), Spread(ratios, Ratio).c_str(),
              met ? "met:" : "missed:", goalText.c_str());
  std::fflush(stdout);
}
