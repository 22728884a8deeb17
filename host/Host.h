// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The Linux host: every service of the platform, assembled over one device root.
#pragma once

#include <memory>
#include <optional>
#include <string>

#include "base/Result.h"
#include "device/DeviceContext.h"
#include "host/PlayedRun.h"
#include "host/counters/CounterStore.h"
#include "host/files/DeviceRoot.h"
#include "platform/AllServices.h"
#include "platform/SystemLog.h"

namespace host {

class StandardErrorLog;

// The device root where nobody names another: "/", or what the build was given.
extern const char kDefaultRoot[];

struct HostOptions {
  std::string root = kDefaultRoot;  // the device root, a path of the host
  platform::LogLevel lowestLevel = platform::LogLevel::standard;
  bool runModules = false;               // of this root, whatever they are: it is trusted
  std::string machineFiles = "/";        // the folder of this machine's /proc, /sys, /etc and /usr
  std::optional<PlayedRun> played = {};  // a run at another time; it posts no notifications
  bool ignoresBrokenPipes = true;        // in the process, from then on (SIGPIPE)
  // Both borrowed: instead of the host's own on standard error, and of that for all but its texts
  // without a level.
  StandardErrorLog* standardError = nullptr;
  platform::SystemLog* log = nullptr;

  // As the environment says: MORVEND_ROOT, MORVEND_LOG and MORVEND_RUN_MODULES.
  static HostOptions fromEnvironment();
};

class Host {
 public:
  explicit Host(const HostOptions& options = HostOptions::fromEnvironment());

  // Waits for a reply of the usage service that has begun, flushes the preferences and writes every
  // event that was sent.
  ~Host();

  // They live as long as the host.
  const platform::AllServices& services() const;
  morvend::DeviceContext& context();  // says where the counters lie
  CounterStore& counters();
  const DeviceRoot& root() const;

  // Brings the preferences to disk, and tells whether all is kept that this process was to keep;
  // the error is of one file's path.
  base::Result<void> kept();

 private:
  struct Assembly;
  std::unique_ptr<Assembly> assembly_;
};

}  // namespace host
