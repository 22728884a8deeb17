#include "platform/host/Host.h"

#include <csignal>
#include <cstdlib>

#include "platform/host/Bus.h"
#include "platform/host/DeviceFileSystem.h"
#include "platform/host/EventSink.h"
#include "platform/host/HostApplications.h"
#include "platform/host/HostDeviceProperties.h"
#include "platform/host/HostDeviceRegistry.h"
#include "platform/host/HostKernel.h"
#include "platform/host/HostKernelSnapshots.h"
#include "platform/host/HostLibraryLoader.h"
#include "platform/host/HostLocale.h"
#include "platform/host/HostNetworkUsage.h"
#include "platform/host/HostPropertyListCodec.h"
#include "platform/host/HostPurgeableSpace.h"
#include "platform/host/HostReportingChannels.h"
#include "platform/host/HostStandardStreams.h"
#include "platform/host/HostSystemVersion.h"
#include "platform/host/MD5Digest.h"
#include "platform/host/PlayedServices.h"
#include "platform/host/PreferenceFiles.h"
#include "platform/host/RunLockFile.h"
#include "platform/host/ServitaLogFiles.h"
#include "platform/host/StandardErrorLog.h"
#include "platform/host/StructuredLogFiles.h"
#include "platform/host/SubmissionSpool.h"

namespace platform::host {

HostOptions HostOptions::fromEnvironment() {
  HostOptions options;
  if (const char* root = std::getenv("MORVEND_ROOT"); root != nullptr && *root != '\0') {
    options.root = root;
  }
  options.lowestLevel = StandardErrorLog::levelNamed(std::getenv("MORVEND_LOG"));
  return options;
}

// In the order of construction: each service stands after those that it uses.
struct Host::Services {
  explicit Services(const HostOptions& options)
      : root(options.root),
        ownLog(options.lowestLevel),
        log(options.log != nullptr ? *options.log : ownLog),
        played(options.played) {}

  void countDamagedDatabase() {
    preferences.addToInteger("DatabaseCorruptionCount", "com.norba.pellorand", 1);
  }

  DeviceRoot root;
  StandardErrorLog ownLog;
  SystemLog& log;
  const std::optional<PlayedRun> played;
  HostStandardStreams streams;
  const std::unique_ptr<SystemClock> ownClock =
      played ? std::make_unique<PlayedClock>(played->now) : std::make_unique<SystemClock>();
  Clock& clock = *ownClock;
  MD5Digest digest;
  HostPropertyListCodec codec;
  DeviceFile propertiesFile{root, codec, log, "device/properties.plist"};
  DeviceFileSystem files{root, propertiesFile};
  PreferenceFiles preferences{root, codec, log};
  HostDeviceProperties deviceProperties{root, propertiesFile};
  HostLibraryLoader libraries{root, preferences};
  morvend::DeviceContext context{deviceProperties, files, libraries, log};
  CounterStore counters{root, clock, log, [this] { return context.homeOfCounters(); },
                        [this] { countDamagedDatabase(); }};
  SubmissionSpool submission{root, codec, preferences, clock, log};
  const std::unique_ptr<StructuredLogFiles> structuredLogs =
      played ? std::make_unique<PlayedStructuredLogs>(root, clock, log, played->incident)
             : std::make_unique<StructuredLogFiles>(root, clock, log);
  ServitaLogFiles servitaLogs{root, log};
  Bus bus{log};
  PlayedNotifications playedNotifications;
  NotificationCenter& notifications =
      played ? static_cast<NotificationCenter&>(playedNotifications) : bus;
  EventSink eventSink{root, codec, clock, log};
  HostSystemVersion systemVersion{root, codec, log};
  const std::unique_ptr<HostKernel> kernel =
      played ? std::make_unique<PlayedKernel>(root, codec, log, *played)
             : std::make_unique<HostKernel>(root, codec, log);
  HostKernelSnapshots snapshots{root};
  HostDeviceRegistry registry{root, codec, log};
  HostPurgeableSpace purgeableSpace{root, codec, log};
  HostReportingChannels reportingChannels{root, codec, log};
  HostApplications applications{root, codec, log};
  HostLocale locale{root, codec, log};
  RunLockFile runLock{root, log};
  HostNetworkUsage networkUsage{root, codec, log};  // last: its replies use the others

  Platform platform{log,
                    streams,
                    clock,
                    digest,
                    codec,
                    files,
                    counters,
                    counters,
                    preferences,
                    preferences,
                    preferences,
                    submission,
                    *structuredLogs,
                    servitaLogs,
                    bus,
                    bus,
                    notifications,
                    eventSink,
                    deviceProperties,
                    systemVersion,
                    *kernel,
                    snapshots,
                    registry,
                    registry,
                    purgeableSpace,
                    reportingChannels,
                    networkUsage,
                    applications,
                    locale,
                    libraries,
                    runLock};
};

Host::Host(const HostOptions& options) : services_(std::make_unique<Services>(options)) {
  // A reader of our output that goes away must not end a run.
  std::signal(SIGPIPE, SIG_IGN);
}

Host::~Host() = default;

Platform& Host::platform() { return services_->platform; }
morvend::DeviceContext& Host::context() { return services_->context; }
CounterStore& Host::counters() { return services_->counters; }
const DeviceRoot& Host::root() const { return services_->root; }

std::string Host::unkept() {
  if (std::string why = services_->preferences.flushAll(); !why.empty()) return why;
  if (std::string why = services_->submission.unsubmitted(); !why.empty()) return why;
  return services_->counters.unrecorded();
}

}  // namespace platform::host
