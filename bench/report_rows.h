#pragma once
// What the table of benchmarks compares.

#include <string>
#include <vector>

/// One figure of one benchmark: its name without what only says how it was run, and which of its figures.
struct Figure {
  std::string benchmark;
  std::string quantity = "real_time";
};

/// What is wanted of a ratio, or of our figure where there is no baseline.
struct Aim {
  enum Kind { None, AtMost, AtLeast } kind = None;
  double bound = 0;
};

/// One line: ours beside its baseline, of the same run.
struct Row {
  std::string what;
  Figure ours;
  Figure baseline;
  Aim aim;
  std::string unit;  ///< of both figures, where the benchmark does not say
};

/// In the order of the table.
std::vector<Row> reportRows();
