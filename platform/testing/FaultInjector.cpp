// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "platform/testing/FaultInjector.h"

#include "platform/Clock.h"
#include "platform/CountersService.h"
#include "platform/DeviceProperties.h"
#include "platform/DeviceRegistry.h"
#include "platform/EventLoop.h"
#include "platform/Eventra.h"
#include "platform/FaultwatchSupport.h"
#include "platform/FileSystem.h"
#include "platform/InstalledApplications.h"
#include "platform/Kernel.h"
#include "platform/KernelSnapshots.h"
#include "platform/LibraryLoader.h"
#include "platform/LocaleService.h"
#include "platform/LogSubmission.h"
#include "platform/NetworkUsage.h"
#include "platform/PLHistory.h"
#include "platform/PreferenceStore.h"
#include "platform/PurgeableSpace.h"
#include "platform/ReportingChannels.h"
#include "platform/RunLock.h"
#include "platform/ServitaLogs.h"
#include "platform/StandardStreams.h"
#include "platform/SystemLog.h"

#include <cerrno>

namespace platform::fakes {

namespace {

struct Plan {
  int calls = 0, failing = 0;
  bool fails() { return ++calls == failing; }
};

struct Files : FileSystem {
  Files(FileSystem& i, Plan& p) : inner(i), plan(p) {}
  FileSystem& inner;
  Plan& plan;
  std::optional<std::uint64_t> fileStatus(std::string_view path) override {
    return plan.fails() ? std::nullopt : inner.fileStatus(path);
  }
  std::optional<Statistics> statfs(std::string_view path) override {
    return plan.fails() ? std::nullopt : inner.statfs(path);
  }
  std::optional<std::string> readFile(std::string_view path, std::size_t maximum) override {
    return plan.fails() ? std::nullopt : inner.readFile(path, maximum);
  }
};

struct FailedHistory : PLHistory {
  base::Result<void> scalarsForKeyPrefix(std::string_view, std::int32_t, std::int32_t,
                                         const ScalarRowHandler&) override {
    return base::Error{"injected"};
  }
  base::Result<void> distributionsForKeyPrefix(std::string_view, std::int32_t, std::int32_t,
                                               const DistributionRowHandler&) override {
    return base::Error{"injected"};
  }
};

struct Histories : HistoryStore {
  Histories(HistoryStore& i, Plan& p) : inner(i), plan(p) {}
  HistoryStore& inner;
  Plan& plan;
  std::unique_ptr<PLHistory> initWithDefaultPath() override {
    if (plan.fails()) return std::make_unique<FailedHistory>();
    return inner.initWithDefaultPath();
  }
};

struct Preferences : PreferenceStore {
  Preferences(PreferenceStore& i, Plan& p) : inner(i), plan(p) {}
  PreferenceStore& inner;
  Plan& plan;
  std::optional<plist::Value> QNSPreferencesGetValue(std::string_view key,
                                                     std::string_view domain) override {
    return plan.fails() ? std::nullopt : inner.QNSPreferencesGetValue(key, domain);
  }
  void QNSPreferencesSetValue(std::string_view key, const plist::Value* value,
                              std::string_view domain) override {
    inner.QNSPreferencesSetValue(key, value, domain);
  }
  void QNSPreferencesSynchronize(std::string_view domain) override {
    inner.QNSPreferencesSynchronize(domain);
  }
  base::Result<std::optional<plist::Value>> readValue(std::string_view key,
                                                      std::string_view domain) override {
    if (plan.fails()) return base::Error{"injected"};
    return inner.readValue(key, domain);
  }
  void holdWrites() override { inner.holdWrites(); }
  void writeHeld() override { inner.writeHeld(); }
};

struct Submissions : LogSubmission {
  Submissions(LogSubmission& i, Plan& p) : inner(i), plan(p) {}
  LogSubmission& inner;
  Plan& plan;
  bool DiagnosticLogSubmissionEnabled() override { return inner.DiagnosticLogSubmissionEnabled(); }
  bool QNSWriteLogForSubmission(std::string_view logType, std::string_view logName,
                                const plist::Dictionary* options, const Writer& writer) override {
    return !plan.fails() && inner.QNSWriteLogForSubmission(logType, logName, options, writer);
  }
};

struct Events : Eventra {
  Events(Eventra& i, Plan& p) : inner(i), plan(p) {}
  Eventra& inner;
  Plan& plan;
  bool offersLazySend() override { return inner.offersLazySend(); }
  bool EventraIsEventUsed(std::string_view event) override {
    return !plan.fails() && inner.EventraIsEventUsed(event);
  }
  bool EventraSendEventLazy(std::string_view event, PayloadProducer producer) override {
    return !plan.fails() && inner.EventraSendEventLazy(event, std::move(producer));
  }
};

struct Listeners : NamedServices {
  Listeners(NamedServices& i, Plan& p) : inner(i), plan(p) {}
  NamedServices& inner;
  Plan& plan;
  std::unique_ptr<NamedServiceListener> listen(std::string_view serviceName) override {
    return plan.fails() ? nullptr : inner.listen(serviceName);
  }
};

struct Device : DeviceProperties, SystemVersion, LibraryLoader {
  Device(const AllServices& i, Plan& p) : inner(i), plan(p) {}
  const AllServices& inner;
  Plan& plan;
  bool booleanProperty(std::string_view name) override {
    return !plan.fails() && inner.deviceProperties.booleanProperty(name);
  }
  std::optional<std::string> textProperty(std::string_view name) override {
    return plan.fails() ? std::nullopt : inner.deviceProperties.textProperty(name);
  }
  std::optional<std::uint32_t> multiUserIndicator() override {
    return plan.fails() ? std::nullopt : inner.deviceProperties.multiUserIndicator();
  }
  std::optional<DiskUsage> diskUsage() override {
    return plan.fails() ? std::nullopt : inner.deviceProperties.diskUsage();
  }
  GroupContainer systemGroupContainerPath(std::string_view identifier) override {
    if (plan.fails()) return {};
    return inner.deviceProperties.systemGroupContainerPath(identifier);
  }
  std::optional<plist::Dictionary> systemVersionDictionary() override {
    return plan.fails() ? std::nullopt : inner.systemVersion.systemVersionDictionary();
  }
  std::string operatingSystemVersion() override {
    return plan.fails() ? std::string() : inner.systemVersion.operatingSystemVersion();
  }
  void* load(std::string_view path) override {
    return plan.fails() ? nullptr : inner.libraries.load(path);
  }
  void* symbol(void* library, const char* name) override {
    return plan.fails() ? nullptr : inner.libraries.symbol(library, name);
  }
};

struct KernelValues : Kernel {
  KernelValues(Kernel& i, Plan& p) : inner(i), plan(p) {}
  Kernel& inner;
  Plan& plan;
  ReadResult sysctlbyname(std::string_view name, std::span<std::byte> buffer) override {
    return plan.fails() ? ReadResult{EIO, 0} : inner.sysctlbyname(name, buffer);
  }
  std::uint64_t pageSize() override { return inner.pageSize(); }
  std::uint64_t absoluteTime() override { return inner.absoluteTime(); }
  std::optional<Timebase> timebase() override {
    return plan.fails() ? std::nullopt : inner.timebase();
  }
  Process process() override { return inner.process(); }
};

// A close that fails has closed all the same, any other call that fails was not made.
struct Registry : DeviceRegistry, DriverConnections {
  Registry(const AllServices& i, Plan& p) : registry(i.registry), drivers(i.drivers), plan(p) {}
  static constexpr DriverStatus kInjected = 0x2BC;
  DeviceRegistry& registry;
  DriverConnections& drivers;
  Plan& plan;
  RegistryObject DrvGetMatchingService(std::string_view className) override {
    return plan.fails() ? 0 : registry.DrvGetMatchingService(className);
  }
  RegistryObject rootEntry() override { return plan.fails() ? 0 : registry.rootEntry(); }
  RegistryObject createIterator() override { return plan.fails() ? 0 : registry.createIterator(); }
  RegistryObject next(RegistryObject iterator) override {
    return plan.fails() ? 0 : registry.next(iterator);
  }
  bool conformsTo(RegistryObject entry, std::string_view className) override {
    return registry.conformsTo(entry, className);
  }
  std::optional<plist::Value> searchProperty(RegistryObject entry, std::string_view key,
                                             Direction direction) override {
    return plan.fails() ? std::nullopt : registry.searchProperty(entry, key, direction);
  }
  void release(RegistryObject object) override { registry.release(object); }
  OpenResult DrvServiceOpen(RegistryObject service, std::uint32_t type) override {
    return plan.fails() ? OpenResult{kInjected, 0} : drivers.DrvServiceOpen(service, type);
  }
  DriverStatus DrvServiceClose(DriverConnection connection) override {
    const DriverStatus status = drivers.DrvServiceClose(connection);
    return plan.fails() ? kInjected : status;
  }
  CallResult DrvCallStructMethod(DriverConnection connection, std::uint32_t method,
                                 std::span<const std::byte> input,
                                 std::span<std::byte> output) override {
    return plan.fails() ? CallResult{kInjected, 0}
                        : drivers.DrvCallStructMethod(connection, method, input, output);
  }
  DriverStatus DrvCallMethod(DriverConnection connection, std::uint32_t method,
                             std::span<const std::uint64_t> input,
                             std::span<std::uint64_t> output) override {
    return plan.fails() ? kInjected : drivers.DrvCallMethod(connection, method, input, output);
  }
};

struct Storage : KernelSnapshots, PurgeableSpace {
  Storage(const AllServices& i, Plan& p) : inner(i), plan(p) {}
  const AllServices& inner;
  Plan& plan;
  std::optional<std::vector<std::byte>> capture(std::uint32_t flags) override {
    return plan.fails() ? std::nullopt : inner.snapshots.capture(flags);
  }
  bool isPresent() override { return inner.purgeableSpace.isPresent(); }
  std::optional<plist::Dictionary> SpacereapCopyItemizedPurgeableSpaceWithInfo(
      const plist::Dictionary& query) override {
    if (plan.fails()) return std::nullopt;
    return inner.purgeableSpace.SpacereapCopyItemizedPurgeableSpaceWithInfo(query);
  }
};

struct Usage : NetworkUsage {
  Usage(NetworkUsage& i, Plan& p) : inner(i), plan(p) {}
  NetworkUsage& inner;
  Plan& plan;
  void queryAllProcesses(Reply reply) override {
    if (plan.fails()) return reply(nullptr);
    inner.queryAllProcesses(std::move(reply));
  }
};

struct Channels : ReportingChannels {
  Channels(ReportingChannels& i, Plan& p) : inner(i), plan(p) {}
  struct Subscription : ChannelSubscription {
    Subscription(std::unique_ptr<ChannelSubscription> i, Plan& p) : inner(std::move(i)), plan(p) {}
    std::unique_ptr<ChannelSubscription> inner;
    Plan& plan;
    std::optional<std::vector<ChannelSample>> createSamples() override {
      return plan.fails() ? std::nullopt : inner->createSamples();
    }
  };
  ReportingChannels& inner;
  Plan& plan;
  std::vector<ReportChannel> copyChannels(std::uint64_t categoryMask) override {
    return plan.fails() ? std::vector<ReportChannel>() : inner.copyChannels(categoryMask);
  }
  std::unique_ptr<ChannelSubscription> subscribe(
      const std::vector<ReportChannel>& channels) override {
    auto subscription = plan.fails() ? nullptr : inner.subscribe(channels);
    return subscription ? std::make_unique<Subscription>(std::move(subscription), plan) : nullptr;
  }
};

}  // namespace

struct FaultInjector::Decorated {
  explicit Decorated(const AllServices& inner)
      : files(inner.files, plan),
        history(inner.history, plan),
        preferences(inner.preferences, plan),
        submission(inner.submission, plan),
        eventra(inner.eventra, plan),
        namedServices(inner.namedServices, plan),
        device(inner, plan),
        kernel(inner.kernel, plan),
        reportingChannels(inner.reportingChannels, plan),
        networkUsage(inner.networkUsage, plan),
        registry(inner, plan),
        storage(inner, plan),
        platform{.log = inner.log,
                 .streams = inner.streams,
                 .clock = inner.clock,
                 .files = files,
                 .counters = inner.counters,
                 .history = history,
                 .preferences = preferences,
                 .analyticsConfiguration = inner.analyticsConfiguration,
                 .privilegedPreferences = inner.privilegedPreferences,
                 .submission = submission,
                 .faultwatch = inner.faultwatch,
                 .servitaLogs = inner.servitaLogs,
                 .eventLoop = inner.eventLoop,
                 .namedServices = namedServices,
                 .notifications = inner.notifications,
                 .eventra = eventra,
                 .deviceProperties = device,
                 .systemVersion = device,
                 .kernel = kernel,
                 .snapshots = storage,
                 .registry = registry,
                 .drivers = registry,
                 .purgeableSpace = storage,
                 .reportingChannels = reportingChannels,
                 .networkUsage = networkUsage,
                 .applications = inner.applications,
                 .locale = inner.locale,
                 .libraries = device,
                 .runLock = inner.runLock,
                 .outbox = inner.outbox} {}

  Plan plan;
  Files files;
  Histories history;
  Preferences preferences;
  Submissions submission;
  Events eventra;
  Listeners namedServices;
  Device device;
  KernelValues kernel;
  Channels reportingChannels;
  Usage networkUsage;
  Registry registry;
  Storage storage;
  AllServices platform;
};

FaultInjector::FaultInjector(const AllServices& inner)
    : decorated_(std::make_unique<Decorated>(inner)) {}
FaultInjector::~FaultInjector() = default;
const AllServices& FaultInjector::platform() const { return decorated_->platform; }
int FaultInjector::calls() const { return decorated_->plan.calls; }
void FaultInjector::failAt(int call) {
  decorated_->plan.calls = 0;
  decorated_->plan.failing = call;
}

}  // namespace platform::fakes
