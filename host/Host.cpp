// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/Host.h"

#include <csignal>
#include <cstdlib>
#include <string_view>

#include "host/PlayedServices.h"
#include "host/RunOutbox.h"
#include "host/bus/Bus.h"
#include "host/device/DeviceServices.h"
#include "host/machine/Device.h"
#include "host/outbox/EventSink.h"
#include "host/outbox/ServitaLogFiles.h"
#include "host/outbox/StructuredLogFiles.h"
#include "host/outbox/SubmissionSpool.h"
#include "host/preferences/PreferenceFiles.h"
#include "host/process/LibraryLoader.h"
#include "host/process/RunLockFile.h"
#include "host/process/StandardErrorLog.h"
#include "host/process/StandardStreams.h"
#include "host/recorded/Device.h"
#include "host/recorded/EccEventFiles.h"
#include "platform/Names.h"

namespace host {

const char kDefaultRoot[] = MORVEND_DEFAULT_ROOT;

HostOptions HostOptions::fromEnvironment() {
  HostOptions options;
  if (const char* root = std::getenv("MORVEND_ROOT"); root != nullptr && *root != '\0') {
    options.root = root;
  }
  options.lowestLevel = StandardErrorLog::levelNamed(std::getenv("MORVEND_LOG"));
  const char* runModules = std::getenv("MORVEND_RUN_MODULES");
  options.runModules = runModules != nullptr && std::string_view(runModules) == "1";
  return options;
}

// In the order of construction: each service stands after those that it uses.
struct Host::Assembly {
  explicit Assembly(const HostOptions& options)
      : root(options.root),
        machineFiles(options.machineFiles),
        ownLog(options.lowestLevel),
        standardError(options.standardError != nullptr ? *options.standardError : ownLog),
        log(options.log != nullptr ? *options.log : standardError),
        played(options.played),
        libraries(root, preferences, log,
                  options.runModules ? LibraryLoader::Trusted::root
                                     : LibraryLoader::Trusted::installed) {}

  void countDamagedDatabase() {
    preferences.addToInteger("DatabaseCorruptionCount", platform::kPellorandDomain, 1);
  }

  DeviceRoot root, machineFiles;
  StandardErrorLog ownLog;
  StandardErrorLog& standardError;
  platform::SystemLog& log;
  const std::optional<PlayedRun> played;
  StandardStreams streams{standardError};
  const std::unique_ptr<SystemClock> ownClock =
      played ? std::make_unique<PlayedClock>(played->now) : std::make_unique<SystemClock>();
  platform::Clock& clock = *ownClock;
  PreferenceFiles preferences{root, log};
  recorded::EccEventFiles eccEvents{root, log};
  DeviceServices device = root.isRecorded() ? recorded::device(root, log, eccEvents)
                                            : machine::device(root, machineFiles, preferences, log);
  LibraryLoader libraries;
  morvend::DeviceContext context{*device.properties, *device.files, libraries, log};
  CounterStore counters{root, clock, log, [this] { return context.homeOfCounters(); },
                        [this] { countDamagedDatabase(); }};
  PendingRun run;
  SubmissionSpool submission{root, preferences, clock, log, run};
  const std::unique_ptr<StructuredLogFiles> structuredLogs =
      played ? std::make_unique<PlayedStructuredLogs>(root, clock, log, run, played->incident)
             : std::make_unique<StructuredLogFiles>(root, clock, log, run);
  ServitaLogFiles servitaLogs{root, log};
  Bus bus{log};
  PlayedNotifications playedNotifications;
  platform::NotificationCenter& notifications =
      played ? static_cast<platform::NotificationCenter&>(playedNotifications) : bus;
  EventSink eventSink{root, clock, log, run};
  const std::unique_ptr<platform::Kernel> kernel =
      played ? std::make_unique<PlayedKernel>(std::move(device.kernel), *played)
             : std::move(device.kernel);
  RunOutbox outbox{root, run, submission, *structuredLogs, eventSink, eccEvents, preferences, log};
  RunLockFile runLock{root, log};
  const std::unique_ptr<platform::NetworkUsage> networkUsage =
      std::move(device.networkUsage);  // last: its replies use the others

  platform::AllServices all{.log = log,
                            .streams = streams,
                            .clock = clock,
                            .files = *device.files,
                            .counters = counters,
                            .history = counters,
                            .preferences = preferences,
                            .analyticsConfiguration = preferences,
                            .privilegedPreferences = preferences,
                            .submission = submission,
                            .faultwatch = *structuredLogs,
                            .servitaLogs = servitaLogs,
                            .eventLoop = bus,
                            .namedServices = bus,
                            .notifications = notifications,
                            .eventra = eventSink,
                            .deviceProperties = *device.properties,
                            .systemVersion = *device.systemVersion,
                            .kernel = *kernel,
                            .snapshots = *device.snapshots,
                            .registry = *device.registry,
                            .drivers = *device.drivers,
                            .purgeableSpace = *device.purgeableSpace,
                            .reportingChannels = *device.reportingChannels,
                            .networkUsage = *networkUsage,
                            .applications = *device.applications,
                            .locale = *device.locale,
                            .libraries = libraries,
                            .runLock = runLock,
                            .outbox = outbox};
};

Host::Host(const HostOptions& options) : assembly_(std::make_unique<Assembly>(options)) {
  // A reader of our output that goes away must not end a run.
  if (options.ignoresBrokenPipes) std::signal(SIGPIPE, SIG_IGN);
}

Host::~Host() = default;

const platform::AllServices& Host::services() const { return assembly_->all; }
morvend::DeviceContext& Host::context() { return assembly_->context; }
CounterStore& Host::counters() { return assembly_->counters; }
const DeviceRoot& Host::root() const { return assembly_->root; }

base::Result<void> Host::kept() {
  return assembly_->preferences.flushAll()
      .and_then([this] { return assembly_->submission.submitted(); })
      .and_then([this] { return assembly_->counters.recorded(); });
}

}  // namespace host
