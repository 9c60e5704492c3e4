// What stands above the report's tables: who reported what, on which machine, with which product, and what is missing.
// Pure functions that survive any document; UTF-8.
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "report/collection.h"

namespace report {

struct LabelledText {
  std::string label;
  std::string text;
};

// The user's own words, as the interactive mode stored them; empty for other collections.
std::vector<LabelledText> UserWords(const Collection& collection);

std::string MachineLine(const Collection& collection);  // empty when nothing is known of it
std::string ProductLine(const Collection& collection);

// What the collection lacks, and why. The first 1,000.
std::vector<LabelledText> MissingParts(const Collection& collection);

struct Gauge {
  std::string name;
  double used = 0;  // bytes
  double total = 0;
  bool isMemory = false;
};
std::vector<Gauge> Gauges(const Collection& collection);

// When the user showed the problem, in seconds since 1970 by the customer's wall clock, as the event log has it.
struct Interval {
  std::optional<double> from;
  std::optional<double> to;
};
Interval ReproductionInterval(const Collection& collection);

}  // namespace report
