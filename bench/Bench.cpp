// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "bench/Bench.h"

#include <algorithm>
#include <cstdio>
#include <ctime>

namespace bench {

namespace {

double median(std::vector<double> values) {
  std::sort(values.begin(), values.end());
  const std::size_t middle = values.size() / 2;
  return values.size() % 2 == 1 ? values[middle] : (values[middle - 1] + values[middle]) / 2;
}

// Of the processor, for this process: what else the machine does stays out of it.
double now() {
  timespec time{};
  ::clock_gettime(CLOCK_PROCESS_CPUTIME_ID, &time);
  return static_cast<double>(time.tv_sec) * 1e9 + static_cast<double>(time.tv_nsec);
}

double nanoseconds(const std::function<void()>& work) {
  const double start = now();
  work();
  return now() - start;
}

// A figure with three significant digits, times in the unit that suits them.
std::string shown(double figure, const std::string& unit) {
  char text[48];
  if (unit != "ns" || figure < 1e4) {
    std::snprintf(text, sizeof text, "%.3g %s", figure, unit.c_str());
  } else if (figure < 1e6) {
    std::snprintf(text, sizeof text, "%.3g us", figure / 1e3);
  } else {
    std::snprintf(text, sizeof text, "%.4g ms", figure / 1e6);
  }
  return text;
}

}  // namespace

void Table::compare(const std::string& what, const std::string& against, double goal, double items,
                    const std::function<void()>& ours, const std::function<void()>& yardstick,
                    int rounds) {
  compareFigures(
      what, against, goal, "ns", [&] { return nanoseconds(ours) / items; },
      [&] { return nanoseconds(yardstick) / items; }, rounds);
}

void Table::compareFigures(const std::string& what, const std::string& against, double goal,
                           const std::string& unit, const std::function<double()>& ours,
                           const std::function<double()>& yardstick, int rounds) {
  std::vector<double> a, b, ratios;
  ours();
  yardstick();
  for (int round = 0; round < rounds; ++round) {
    a.push_back(ours());
    b.push_back(yardstick());
    ratios.push_back(a.back() / b.back());
  }
  add({what, against, goal, median(a), median(b), median(ratios), unit});
}

void Table::add(Row row) {
  if (rows_.empty()) {
    std::printf("%-46s %-40s %12s %12s %8s %6s\n", "what", "against", "ours", "yardstick", "ratio",
                "goal");
  }
  std::printf("%-46s %-40s %12s %12s %7.3fx %5.3gx%s\n", row.what.c_str(), row.against.c_str(),
              shown(row.ours, row.unit).c_str(), shown(row.yardstick, row.unit).c_str(), row.ratio,
              row.goal, row.ratio <= row.goal ? "" : "  MISSED");
  std::fflush(stdout);
  rows_.push_back(std::move(row));
}

int Table::finish() const {
  const auto missed = std::count_if(rows_.begin(), rows_.end(),
                                    [](const Row& row) { return row.ratio > row.goal; });
  std::printf("%zu rows, %d missed their goal\n", rows_.size(), static_cast<int>(missed));
  return static_cast<int>(missed);
}

}  // namespace bench
