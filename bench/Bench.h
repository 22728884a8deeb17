// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Side-by-side measurement: our way of doing a thing beside a yardstick, in turns, in one run.
#pragma once

#include <functional>
#include <string>
#include <vector>

namespace bench {

// One line of the table.
struct Row {
  std::string what, against;
  double goal;             // ours over the yardstick, at most
  double ours, yardstick;  // medians
  double ratio;            // median of the ratios of the pairs
  std::string unit;
};

class Table {
 public:
  // Runs both in turns, `rounds` pairs after one uncounted pair, and adds the row. The
  // times are the processor's for this process, divided by `items`, the number of things that one
  // call does.
  void compare(const std::string& what, const std::string& against, double goal, double items,
               const std::function<void()>& ours, const std::function<void()>& yardstick,
               int rounds = 15);

  // The same for figures that the functions measure themselves, such as peak memory.
  void compareFigures(const std::string& what, const std::string& against, double goal,
                      const std::string& unit, const std::function<double()>& ours,
                      const std::function<double()>& yardstick, int rounds = 15);

  // Prints the rows as they come, and at the end how many miss their goal; returns that number.
  int finish() const;

 private:
  void add(Row row);

  std::vector<Row> rows_;
};

// Keeps the compiler from removing the computation of a value.
template <typename T>
void keep(const T& value) {
  asm volatile("" : : "r,m"(value) : "memory");
}

}  // namespace bench
