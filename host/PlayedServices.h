// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The services that differ in a run at another time.
#pragma once

#include <string>
#include <utility>

#include "host/PlayedRun.h"
#include "host/outbox/StructuredLogFiles.h"
#include "host/process/SystemClock.h"
#include "host/recorded/Kernel.h"
#include "platform/EventLoop.h"

namespace host {

class PlayedClock final : public SystemClock {
 public:
  explicit PlayedClock(plist::Date now) : now_(now) {}
  plist::Date now() override { return now_; }

 private:
  plist::Date now_;
};

class PlayedKernel final : public recorded::Kernel {
 public:
  PlayedKernel(const DeviceRoot& root, platform::SystemLog& log, PlayedRun run)
      : recorded::Kernel(root, log), run_(std::move(run)) {}
  std::uint64_t absoluteTime() override { return run_.sinceBoot; }
  Process process() override { return run_.process; }

 private:
  PlayedRun run_;
};

class PlayedStructuredLogs final : public StructuredLogFiles {
 public:
  PlayedStructuredLogs(const DeviceRoot& root, platform::Clock& clock, platform::SystemLog& log,
                       const PendingRun& run, std::string incident)
      : StructuredLogFiles(root, clock, log, run), incident_(std::move(incident)) {}
  std::string newIncidentIdentifier() override { return incident_; }

 private:
  const std::string incident_;
};

// Nobody hears today what happened then.
class PlayedNotifications final : public platform::NotificationCenter {
 public:
  void postNotification(std::string_view) override {}
};

}  // namespace host
