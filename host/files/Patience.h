// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What is tried again: reads and writes that may succeed a moment later.
#pragma once

#include <chrono>
#include <functional>
#include <mutex>
#include <type_traits>
#include <utility>

#include "base/Result.h"
#include "host/files/FileLock.h"

namespace host {

// Whether what failed may succeed a moment later: the disk, or the process, has no room now, or the
// device gave an error.
bool mayPass(const base::Error& error);

// Runs a step again when it fails for what may pass: at most kMaxMore times, each after a longer
// pause, and all steps of a process together pause for no longer than kMaxPauses: a disk that stays
// full must not hold a day up. Nothing is paused for while nothing is wrong. For any thread.
class Patience {
 public:
  static constexpr int kMaxMore = 3;
  static constexpr std::chrono::milliseconds kMaxPauses{5000};

  using Pause = std::function<void(std::chrono::milliseconds)>;
  explicit Patience(Pause pause = LockWait::sleepFor) : pause_(std::move(pause)) {}

  // `step` returns a Result, and can be run more than once.
  template <typename Step>
  std::invoke_result_t<Step> operator()(Step step) {
    for (int failed = 0;; ++failed) {
      auto done = step();
      if (done || !mayPass(done.error()) || failed == kMaxMore || !pausesAfter(failed)) return done;
    }
  }

 private:
  bool pausesAfter(int failed);

  const Pause pause_;
  std::mutex mutex_;  // over what follows
  std::chrono::milliseconds left_ = kMaxPauses;
};

}  // namespace host
