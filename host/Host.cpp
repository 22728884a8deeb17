// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/Host.h"

#include <csignal>
#include <cstdlib>
#include <string_view>

#include "host/PlayedServices.h"
#include "host/RunOutbox.h"
#include "host/bus/Bus.h"
#include "host/files/DeviceFileSystem.h"
#include "host/outbox/EventSink.h"
#include "host/outbox/ServitaLogFiles.h"
#include "host/outbox/StructuredLogFiles.h"
#include "host/outbox/SubmissionSpool.h"
#include "host/preferences/PreferenceFiles.h"
#include "host/process/LibraryLoader.h"
#include "host/process/RunLockFile.h"
#include "host/process/StandardErrorLog.h"
#include "host/process/StandardStreams.h"
#include "host/recorded/Applications.h"
#include "host/recorded/DeviceProperties.h"
#include "host/recorded/DeviceRegistry.h"
#include "host/recorded/Kernel.h"
#include "host/recorded/KernelSnapshots.h"
#include "host/recorded/Locale.h"
#include "host/recorded/NetworkUsage.h"
#include "host/recorded/PurgeableSpace.h"
#include "host/recorded/ReportingChannels.h"
#include "host/recorded/SystemVersion.h"
#include "platform/Names.h"

namespace host {

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
        ownLog(options.lowestLevel),
        log(options.log != nullptr ? *options.log : ownLog),
        played(options.played),
        libraries(root, preferences, log,
                  options.runModules ? LibraryLoader::Trusted::root
                                     : LibraryLoader::Trusted::installed) {}

  void countDamagedDatabase() {
    preferences.addToInteger("DatabaseCorruptionCount", platform::kPellorandDomain, 1);
  }

  DeviceRoot root;
  StandardErrorLog ownLog;
  platform::SystemLog& log;
  const std::optional<PlayedRun> played;
  StandardStreams streams;
  const std::unique_ptr<SystemClock> ownClock =
      played ? std::make_unique<PlayedClock>(played->now) : std::make_unique<SystemClock>();
  platform::Clock& clock = *ownClock;
  DeviceFile propertiesFile{root, log, "device/properties.plist"};
  DeviceFileSystem files{root, propertiesFile};
  PreferenceFiles preferences{root, log};
  recorded::DeviceProperties deviceProperties{root, propertiesFile};
  LibraryLoader libraries;
  morvend::DeviceContext context{deviceProperties, files, libraries, log};
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
  recorded::SystemVersion systemVersion{root, log};
  const std::unique_ptr<recorded::Kernel> kernel =
      played ? std::make_unique<PlayedKernel>(root, log, *played)
             : std::make_unique<recorded::Kernel>(root, log);
  RunOutbox outbox{root, run, submission, *structuredLogs, eventSink, *kernel, preferences, log};
  recorded::KernelSnapshots snapshots{root};
  recorded::DeviceRegistry registry{root, log};
  recorded::PurgeableSpace purgeableSpace{root, log};
  recorded::ReportingChannels reportingChannels{root, log};
  recorded::Applications applications{root, log};
  recorded::Locale locale{root, log};
  RunLockFile runLock{root, log};
  recorded::NetworkUsage networkUsage{root, log};  // last: its replies use the others

  platform::AllServices all{.log = log,
                            .streams = streams,
                            .clock = clock,
                            .files = files,
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
                            .deviceProperties = deviceProperties,
                            .systemVersion = systemVersion,
                            .kernel = *kernel,
                            .snapshots = snapshots,
                            .registry = registry,
                            .drivers = registry,
                            .purgeableSpace = purgeableSpace,
                            .reportingChannels = reportingChannels,
                            .networkUsage = networkUsage,
                            .applications = applications,
                            .locale = locale,
                            .libraries = libraries,
                            .runLock = runLock,
                            .outbox = outbox};
};

Host::Host(const HostOptions& options) : assembly_(std::make_unique<Assembly>(options)) {
  // A reader of our output that goes away must not end a run.
  std::signal(SIGPIPE, SIG_IGN);
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
