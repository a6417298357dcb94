// SPDX-License-Identifier: MIT
// Times of one thing and of its peer, taken in turns, and the line of the table that they make.
#pragma once

#include <string>
#include <vector>

// Seconds since some time in the past.
double Now();

double Median(std::vector<double> values);  // of at least one

// Prints the table's head; the lines of Comparison follow.
void PrintHead();

class Comparison {
 public:
  // How the goal is put: as a part of the peer's time, or as seconds more than it. In either case
  // the median of the rounds must not be above it.
  enum class Measure { kRatio, kDifference };

  Comparison(std::string title, Measure goalMeasure, double goalValue)
      : name(std::move(title)), measure(goalMeasure), goal(goalValue) {}

  // One round, in seconds.
  void Add(double time, double peerTime) { rounds.push_back({time, peerTime}); }

  // The median of each side, and median, least and greatest of the rounds' ratio and, when the goal
  // is one, difference. At least one round is needed, and seven or more make a figure to rely on.
  void Print() const;

 private:
  struct Round {
    double time;
    double peer;
  };

  std::string name;
  Measure measure;
  double goal;
  std::vector<Round> rounds;
};
