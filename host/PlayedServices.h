// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The services that differ in a run at another time.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <utility>

#include "host/PlayedRun.h"
#include "host/outbox/StructuredLogFiles.h"
#include "host/process/SystemClock.h"
#include "platform/EventLoop.h"
#include "platform/Kernel.h"

namespace host {

class PlayedClock final : public SystemClock {
 public:
  explicit PlayedClock(plist::Date now) : now_(now) {}
  plist::Date now() override { return now_; }

 private:
  plist::Date now_;
};

class PlayedKernel final : public platform::Kernel {
 public:
  PlayedKernel(std::unique_ptr<platform::Kernel> device, PlayedRun run)
      : device_(std::move(device)), run_(std::move(run)) {}
  ReadResult sysctlbyname(std::string_view name, std::span<std::byte> buffer) override {
    return device_->sysctlbyname(name, buffer);
  }
  std::uint64_t pageSize() override { return device_->pageSize(); }
  std::uint64_t absoluteTime() override { return run_.sinceBoot; }
  std::optional<Timebase> timebase() override { return device_->timebase(); }
  Process process() override { return run_.process; }

 private:
  const std::unique_ptr<platform::Kernel> device_;
  const PlayedRun run_;
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
