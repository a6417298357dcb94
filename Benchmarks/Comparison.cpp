// SPDX-License-Identifier: MIT
#include "Comparison.h"

#include <windows.h>

#include <algorithm>
#include <cmath>
#include <cstdio>

namespace {

std::string Times(double ratio) {
  char text[32];
  std::snprintf(text, sizeof text, "%.2fx", ratio);
  return text;
}

// "median (least to greatest)"
std::string Spread(const std::vector<double>& values, std::string (*format)(double)) {
  const auto [least, greatest] = std::minmax_element(values.begin(), values.end());
  return format(Median(values)) + " (" + format(*least) + " to " + format(*greatest) + ")";
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

std::string TimeText(double seconds) {
  char text[32];
  const double size = std::fabs(seconds);
  const char* const format = size < 1e-3 ? "%.3f us" : size < 1 ? "%.2f ms" : "%.2f s";
  std::snprintf(text, sizeof text, format, seconds * (size < 1e-3 ? 1e6 : size < 1 ? 1e3 : 1));
  return text;
}

template <class Function>
std::vector<double> Comparison::Values(Function function) const {
  std::vector<double> values;
  for (const Round& round : rounds) values.push_back(function(round));
  return values;
}

std::vector<double> Comparison::Ratios() const {
  return Values([](const Round& round) { return round.time / round.peer; });
}

std::vector<double> Comparison::Differences() const {
  return Values([](const Round& round) { return round.time - round.peer; });
}

double Comparison::Time() const {
  return Median(Values([](const Round& round) { return round.time; }));
}

double Comparison::PeerTime() const {
  return Median(Values([](const Round& round) { return round.peer; }));
}

std::string Comparison::RatioText() const { return Spread(Ratios(), Times); }

bool Comparison::IsMet() const {
  return !goal || Median(measure == Measure::kRatio ? Ratios() : Differences()) <= *goal;
}

std::string Comparison::GoalText() const {
  if (!goal) return "";
  if (measure == Measure::kRatio) return Times(*goal);
  return TimeText(*goal) + " more; is " + Spread(Differences(), TimeText);
}

std::string Comparison::Row() const {
  return "| " + name + " | " + TimeText(Time()) + " | " + TimeText(PeerTime()) + " | " +
         RatioText() + " | " + GoalText() + " | " +
         (!goal     ? ""
          : IsMet() ? "met"
                    : "**missed**") +
         " |\n";
}

std::string Comparison::ChartLine() const {
  const std::vector<double> ratios = Ratios();
  const auto [least, greatest] = std::minmax_element(ratios.begin(), ratios.end());
  char numbers[128];
  std::snprintf(numbers, sizeof numbers, "\t%.4f\t%.4f\t%.4f\t", Median(ratios), *least, *greatest);
  const bool ratioGoal = goal && measure == Measure::kRatio;
  std::string label;
  for (const char ch : name)
    if (ch != '`') label += ch == '"' ? '\'' : ch;  // gnuplot has its own use for quotes
  return label + numbers + (ratioGoal ? std::to_string(*goal) : "?") + "\n";
}
