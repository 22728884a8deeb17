// A run at another time than now, as a device's past is made of.
#pragma once

#include <cstdint>

#include "platform/EventLoop.h"
#include "platform/host/HostKernel.h"
#include "platform/host/SystemClock.h"

namespace platform::host {

// What such a run is told of itself.
struct PlayedRun {
  Date now;                 // its clock stands
  std::uint64_t sinceBoot;  // ticks
  Kernel::Process process;
};

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

// Nobody hears today what happened then.
class PlayedNotifications final : public NotificationCenter {
 public:
  void postNotification(std::string_view) override {}
};

}  // namespace platform::host
