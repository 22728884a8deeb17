// The services that differ in a run at another time.
#pragma once

#include <string>
#include <utility>

#include "platform/EventLoop.h"
#include "platform/host/HostKernel.h"
#include "platform/host/PlayedRun.h"
#include "platform/host/StructuredLogFiles.h"
#include "platform/host/SystemClock.h"

namespace platform::host {

class PlayedClock final : public SystemClock {
 public:
  explicit PlayedClock(Date now) : now_(now) {}
  Date now() override { return now_; }

 private:
  Date now_;
};

class PlayedKernel final : public HostKernel {
 public:
  PlayedKernel(const DeviceRoot& root, PropertyListCodec& codec, SystemLog& log, PlayedRun run)
      : HostKernel(root, codec, log), run_(std::move(run)) {}
  std::uint64_t absoluteTime() override { return run_.sinceBoot; }
  Process process() override { return run_.process; }

 private:
  PlayedRun run_;
};

class PlayedStructuredLogs final : public StructuredLogFiles {
 public:
  PlayedStructuredLogs(const DeviceRoot& root, Clock& clock, SystemLog& log, std::string incident)
      : StructuredLogFiles(root, clock, log), incident_(std::move(incident)) {}
  std::string newIncidentIdentifier() override { return incident_; }

 private:
  const std::string incident_;
};

// Nobody hears today what happened then.
class PlayedNotifications final : public NotificationCenter {
 public:
  void postNotification(std::string_view) override {}
};

}  // namespace platform::host
