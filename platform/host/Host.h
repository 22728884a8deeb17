// The Linux host: every service of the platform, assembled over one device root.
#pragma once

#include <functional>
#include <memory>
#include <optional>
#include <string>

#include "platform/Platform.h"
#include "platform/host/CounterStore.h"
#include "platform/host/DeviceRoot.h"
#include "platform/host/PlayedRun.h"

namespace platform::host {

struct HostOptions {
  std::string root = "/";  // the device root, a path of the host
  LogLevel lowestLevel = LogLevel::standard;
  std::optional<PlayedRun> played = {};  // a run at another time; it posts no notifications
  SystemLog* log = nullptr;              // borrowed; instead of the one on standard error

  // As the environment says: MORVEND_ROOT and MORVEND_LOG.
  static HostOptions fromEnvironment();
};

class Host {
 public:
  explicit Host(const HostOptions& options = HostOptions::fromEnvironment());

  // Waits for a reply of the usage service that has begun, flushes the preferences and writes every
  // event that was sent.
  ~Host();

  // The services live as long as the host.
  Platform& platform();
  CounterStore& counters();
  const DeviceRoot& root() const;

  // Brings the preferences to disk, and tells what couldn't be kept of all that this process was to
  // keep: one file's path, and why. Empty when everything is kept.
  std::string unkept();

  // Tells where the counters' data lie: `home` yields a device path (borrowed), or null while there
  // is no such place. Until it is told, there are no counters. Called from any thread, to the end
  // of the host.
  void keepCountersBelow(std::function<const std::string*()> home);

 private:
  struct Services;
  std::unique_ptr<Services> services_;
};

}  // namespace platform::host
