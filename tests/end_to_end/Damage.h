// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What must hold of a device once a run without a fault has followed one with a fault, and the
// figures of many such pairs.
#pragma once

#include <cstddef>
#include <string>

#include "end_to_end/Device.h"

namespace end_to_end {

// The day that is recorded as done.
inline constexpr char kGateRecord[] = "LastCrashLogSerializationDateInDaysSince1970";

// What is wrong with a device; `what` says it.
struct Damage {
  bool lost = false, doubled = false, torn = false;
  std::string what;
};

// The device's day against that of `clean`, which had the same without a fault: each log with its
// options, each event, structured log and memory error once, counters exact, data usage and its
// baseline too, every file whole, nothing waiting. `before` is what both began from. Data usage may
// be left to another run, which this makes then.
enum class Usage { counted, left };
Damage damageOf(const Device& before, const Device& clean, const Device& device,
                Usage usage = Usage::counted);

// Of the faults of one kind; written as a row of a table at the end.
class Figures {
 public:
  explicit Figures(std::string kind) : kind_(std::move(kind)) {}
  ~Figures();

  // One more; `late` when the day's report wasn't there before the second run. It is a failure of
  // the test, with the outcomes' texts, when anything but what is expected is wrong.
  void count(const Damage& damage, bool late, const std::string& texts,
             const std::string& expected = "");

 private:
  std::string kind_;
  std::size_t tried_ = 0, late_ = 0, lost_ = 0, doubled_ = 0, torn_ = 0;
};

}  // namespace end_to_end
