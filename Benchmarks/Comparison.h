// SPDX-License-Identifier: MIT
// Times of one thing and of its peer, taken in turns: what they make in a table and in a chart.
#pragma once

#include <optional>
#include <string>
#include <utility>
#include <vector>

// Seconds since some time in the past.
double Now();

double Median(std::vector<double> values);  // of at least one

// A time in the unit that suits its size.
std::string TimeText(double seconds);

class Comparison {
 public:
  // How the goal is put: as a part of the peer's time, or as seconds more than it. In either case
  // the median of the rounds must not be above it.
  enum class Measure { kRatio, kDifference };

  // Fewer rounds make no figure to rely on.
  static constexpr int kRounds = 9;

  Comparison(std::string title, Measure goalMeasure, double goalValue)
      : name(std::move(title)), measure(goalMeasure), goal(goalValue) {}
  // Without a goal.
  explicit Comparison(std::string title) : name(std::move(title)) {}

  // One round, in seconds.
  void Add(double time, double peerTime) { rounds.push_back({time, peerTime}); }

  // Rounds of so many turns on each side, whose medians count: with short turns, what interrupts one
  // of them does not show. Each side returns the seconds of one operation, negative when it failed;
  // then the answer is false.
  template <class Own, class Peer>
  bool Measured(Own own, Peer peer, int turns = 1) {
    for (int round = 0; round < kRounds; ++round) {
      std::vector<double> times;
      std::vector<double> peerTimes;
      for (int turn = 0; turn < turns; ++turn) {
        // Who is first changes, so that what the order does evens out.
        const bool ownFirst = (round + turn) % 2 == 0;
        if (ownFirst) times.push_back(own());
        peerTimes.push_back(peer());
        if (!ownFirst) times.push_back(own());
        if (times.back() < 0 || peerTimes.back() < 0) return false;
      }
      Add(Median(times), Median(peerTimes));
    }
    return true;
  }

  double Time() const;
  double PeerTime() const;
  std::string RatioText() const;  // the rounds' median ratio, with the least and the greatest
  bool IsMet() const;             // true without a goal

  // The row of a table in Markdown under kHead. At least one round is needed.
  std::string Row() const;
  static constexpr char kHead[] =
      "| what : its peer | time | peer's time | ratio (least to greatest) | goal | |\n"
      "|---|--:|--:|---|---|---|\n";
  // The line of a chart: name, ratio, least, greatest and goal (a question mark without one), by
  // tabs.
  std::string ChartLine() const;

 private:
  struct Round {
    double time;
    double peer;
  };

  template <class Function>
  std::vector<double> Values(Function function) const;
  std::vector<double> Ratios() const;
  std::vector<double> Differences() const;
  std::string GoalText() const;

  std::string name;
  Measure measure = Measure::kRatio;
  std::optional<double> goal;
  std::vector<Round> rounds;
};

// Seconds of one call of `function`, from `count` of them.
template <class Function>
double SecondsPerCall(int count, Function function) {
  const double start = Now();
  for (int i = 0; i < count; ++i) function();
  return (Now() - start) / count;
}
