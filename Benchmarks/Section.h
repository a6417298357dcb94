// SPDX-License-Identifier: MIT
// The results of one group of measurements: a section in Markdown on standard output, and the
// numbers of its chart in a file.
#pragma once

#include <cstdio>
#include <fstream>
#include <string>

#include "Comparison.h"

class Section {
 public:
  // With an empty path, writes no chart. Throws when the file cannot be written.
  explicit Section(const std::string& chartFile) {
    if (chartFile.empty()) return;
    chart.exceptions(std::ofstream::failbit | std::ofstream::badbit);
    chart.open(chartFile, std::ios::binary);
  }

  void Begin(const std::string& title, const std::string& text) {
    Print("\n## " + title + "\n\n" + text + "\n\n");
  }
  void Head() { Print(Comparison::kHead); }
  void Add(const Comparison& comparison) {
    Print(comparison.Row());
    if (chart.is_open()) chart << comparison.ChartLine() << std::flush;
  }
  // Prints Markdown text.
  void Print(const std::string& text) {
    std::fputs(text.c_str(), stdout);
    std::fflush(stdout);
  }
  // Writes a line to the chart's file.
  void Chart(const std::string& line) {
    if (chart.is_open()) chart << line << std::flush;
  }

 private:
  std::ofstream chart;
};
