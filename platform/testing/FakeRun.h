// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What stands around a run, in memory: the lock that it holds, and what keeps back what it leaves.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "platform/Outbox.h"
#include "platform/RunLock.h"

namespace platform::fakes {

// Says what is asked of it by `calls`: "settle <day>", "hold <day>", "hold", "publish".
class FakeOutbox : public Outbox {
 public:
  std::vector<std::string> calls;
  void settle(std::int64_t recordedDay) override {
    calls.push_back("settle " + std::to_string(recordedDay));
  }
  void hold(std::optional<std::int32_t> day) override {
    calls.push_back(day ? "hold " + std::to_string(*day) : "hold");
  }
  void publish() override { calls.push_back("publish"); }
};

class FakeRunLock : public RunLock {
 public:
  int held = 0, taken = 0;
  void lock() override { ++held, ++taken; }
  void unlock() override { --held; }
};

}  // namespace platform::fakes
