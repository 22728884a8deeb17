// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "platform/testing/FakePlatform.h"

#include <algorithm>
#include <cerrno>
#include <span>
#include <string_view>
#include <thread>

#include "base/ByteWriter.h"
#include "base/Text.h"

namespace platform::fakes {

std::optional<std::uint64_t> FakeFileSystem::fileStatus(std::string_view path) {
  const auto found = contents.find(path);
  return found != contents.end() ? std::optional<std::uint64_t>(found->second.size())
                                 : std::nullopt;
}

std::optional<FileSystem::Statistics> FakeFileSystem::statfs(std::string_view path) {
  const auto volume = volumes.find(path);
  if (volume == volumes.end()) return std::nullopt;
  return volume->second;
}

std::optional<std::string> FakeFileSystem::readFile(std::string_view path, std::size_t maximum) {
  const auto found = contents.find(path);
  if (found == contents.end()) return std::nullopt;
  return found->second.substr(0, maximum);
}

namespace {

class BlockEnumerator : public PLHistoryDistributionEnumerator {
 public:
  BlockEnumerator(const std::vector<double>& samples, std::size_t blockSize, bool comesAgain)
      : left_(samples),
        offsets_(samples.size(), 0),
        blockSize_(blockSize),
        comesAgain_(comesAgain) {}

  base::Result<Samples> getNextValues() override {
    const std::size_t count = std::min(blockSize_, left_.size());
    const auto values = left_.first(count);
    left_ = left_.subspan(count);
    return Samples{values, std::span(offsets_).first(count)};
  }

  bool comesAgain() override { return comesAgain_; }

 private:
  std::span<const double> left_;
  std::vector<std::int32_t> offsets_;
  std::size_t blockSize_;
  bool comesAgain_;
};

class OpenHistory : public PLHistory {
 public:
  explicit OpenHistory(FakeHistory& store) : store_(store) {}

  base::Result<void> scalarsForKeyPrefix(std::string_view keyPrefix, std::int32_t minDay,
                                         std::int32_t maxDay,
                                         const ScalarRowHandler& rowHandler) override {
    bool stop = false;
    for (const auto& [row, value] : store_.scalars) {
      if (stop || !covers(row, keyPrefix, minDay, maxDay)) continue;
      rowHandler(row.second, row.first, value, stop);
    }
    return store_.nextOutcome();
  }

  base::Result<void> distributionsForKeyPrefix(std::string_view keyPrefix, std::int32_t minDay,
                                               std::int32_t maxDay,
                                               const DistributionRowHandler& rowHandler) override {
    bool stop = false;
    for (const auto& [row, samples] : store_.distributions) {
      if (stop || !covers(row, keyPrefix, minDay, maxDay)) continue;
      const bool comesAgain =
          row.first == maxDay - 1 && store_.distributions.contains({maxDay, row.second});
      BlockEnumerator enumerator(samples, store_.blockSize, comesAgain);
      rowHandler(row.second, row.first, enumerator, stop);
    }
    return store_.nextOutcome();
  }

 private:
  static bool covers(const FakeHistory::RowKey& row, std::string_view keyPrefix,
                     std::int32_t minDay, std::int32_t maxDay) {
    return row.first >= minDay && row.first <= maxDay && row.second.starts_with(keyPrefix);
  }

  FakeHistory& store_;
};

}  // namespace

base::Result<void> FakeHistory::nextOutcome() {
  if (firstOutcomes.empty()) return outcome;
  auto first = std::move(firstOutcomes.front());
  firstOutcomes.erase(firstOutcomes.begin());
  return first;
}

std::unique_ptr<PLHistory> FakeHistory::initWithDefaultPath() {
  return std::make_unique<OpenHistory>(*this);
}

std::optional<plist::Value> FakePreferences::mobile(std::string_view domain,
                                                    std::string_view key) const {
  const auto found = values.find({"mobile", std::string(domain), std::string(key)});
  return found != values.end() ? std::optional(found->second) : std::nullopt;
}

void FakePreferences::setMobile(std::string_view domain, std::string_view key, plist::Value value) {
  values.insert_or_assign({"mobile", std::string(domain), std::string(key)}, std::move(value));
}

void FakePreferences::write(std::string_view user, std::string_view domain, std::string_view key,
                            const plist::Value* value) {
  const std::tuple place{std::string(user), std::string(domain), std::string(key)};
  const std::string where = std::string(user) + "/" + std::get<1>(place) + "/" + std::get<2>(place);
  if (value != nullptr) {
    values.insert_or_assign(place, *value);
    journal_.push_back("set " + where + " = " + plist::description(*value));
  } else {
    values.erase(place);
    journal_.push_back("remove " + where);
  }
}

std::optional<plist::Value> FakePreferences::QNSPreferencesGetValue(std::string_view key,
                                                                    std::string_view domain) {
  return mobile(domain, key);
}

void FakePreferences::QNSPreferencesSetValue(std::string_view key, const plist::Value* value,
                                             std::string_view domain) {
  write("mobile", domain, key, value);
}

void FakePreferences::QNSPreferencesSynchronize(std::string_view domain) {
  journal_.push_back("synchronize " + std::string(domain));
}

base::Result<std::optional<plist::Value>> FakePreferences::readValue(std::string_view key,
                                                                     std::string_view domain) {
  if (!readable) return base::Error{"unreadable"};
  return mobile(domain, key);
}

std::optional<plist::Value> FakePreferences::getPreference(std::string_view key,
                                                           std::string_view domain) {
  const auto found = values.find({"__quenset__", std::string(domain), std::string(key)});
  return found != values.end() ? std::optional(found->second) : std::nullopt;
}

void FakePreferences::setPreference(std::string_view key, const plist::Value* value,
                                    std::string_view domain, bool synchronize) {
  write("__quenset__", domain, key, value);
  if (synchronize) journal_.push_back("synchronize configuration " + std::string(domain));
}

void FakePreferences::setPreference(std::string_view key, std::string_view user,
                                    std::string_view domain, const plist::Value* value) {
  journal_.push_back("privileged set");
  write(user, domain, key, value);
}

void FakePreferences::deletePreference(std::string_view key, std::string_view user,
                                       std::string_view domain) {
  journal_.push_back("privileged delete");
  write(user, domain, key, nullptr);
}

namespace {

class StringHandle : public LogHandle {
 public:
  explicit StringHandle(std::string& contents) : contents_(contents) {}
  bool write(std::string_view bytes) override {
    contents_ += bytes;
    return true;
  }

 private:
  std::string& contents_;
};

}  // namespace

bool FakeSubmission::QNSWriteLogForSubmission(std::string_view logType, std::string_view logName,
                                              const plist::Dictionary* options,
                                              const Writer& writer) {
  if (!accepts) return false;
  beforeLog();
  Log log{std::string(logType), std::string(logName), {}, {}};
  if (options != nullptr) log.options = *options;
  StringHandle handle(log.contents);
  writer(handle);
  logs.push_back(std::move(log));
  journal_.push_back("submit " + logs.back().name);
  return true;
}

void FakeHousekeeping::logStructuredData(std::int32_t type, const plist::Dictionary& data) {
  structured.emplace_back(type, data);
  journal_.push_back(base::format("structured %d ", type) + plist::description(plist::Value(data)));
}

class FakeService::Listener : public NamedServiceListener {
 public:
  explicit Listener(FakeService& service) : service_(service) {}
  void start(EventHandler handler) override { service_.handler_ = std::move(handler); }

 private:
  FakeService& service_;
};

void FakeService::willDeliver(std::optional<plist::Dictionary> message) {
  script.push_back([this, message = std::move(message)] {
    if (handler_) handler_(message ? &*message : nullptr);
    return RunResult::handledSource;
  });
}

EventLoop::RunResult FakeService::run(double seconds, bool returnAfterSourceHandled) {
  journal_.push_back(base::format("run loop %g %d", seconds, returnAfterSourceHandled ? 1 : 0));
  if (script.empty()) return RunResult::timedOut;
  const auto step = std::move(script.front());
  script.pop_front();
  return step();
}

std::unique_ptr<NamedServiceListener> FakeService::listen(std::string_view serviceName) {
  journal_.push_back("listen " + std::string(serviceName));
  if (!registers) return nullptr;
  return std::make_unique<Listener>(*this);
}

bool FakeEventra::EventraSendEventLazy(std::string_view event, PayloadProducer producer) {
  if (!hasLazySend || !queuesEvents || !EventraIsEventUsed(event)) return false;
  if (defers) {
    waiting_.emplace_back(event, std::move(producer));
  } else {
    events.emplace_back(event, producer());
  }
  return true;
}

void FakeEventra::deliver() {
  std::thread([this] {
    for (const auto& [event, producer] : std::exchange(waiting_, {})) {
      events.emplace_back(event, producer());
    }
  }).join();
}

bool FakeDevice::booleanProperty(std::string_view name) {
  ++internalBuildQueries;
  return name == "InternalBuild" && internalBuild;
}

std::optional<std::string> FakeDevice::textProperty(std::string_view name) {
  const auto found = texts.find(name);
  return found != texts.end() ? std::optional(found->second) : std::nullopt;
}

DeviceProperties::GroupContainer FakeDevice::systemGroupContainerPath(std::string_view) {
  ++containerQueries;
  return {container, containerError};
}

void FakeDevice::enumerateBundles(const std::function<void(BundleType)>& handler) {
  ++enumerations;
  for (const BundleType type : bundles) handler(type);
}

void* FakeDevice::load(std::string_view path) {
  ++loads;
  return libraryLoads && path == kFaultwatchSupportPath ? this : nullptr;
}

void* FakeDevice::symbol(void*, const char* name) {
  const auto found = symbols.find(name);
  return found != symbols.end() ? found->second : nullptr;
}

Kernel::ReadResult FakeKernel::sysctlbyname(std::string_view name, std::span<std::byte> buffer) {
  reads.emplace_back(name);
  if (const auto once = deliveries.find(name); once != deliveries.end() && !once->second.empty()) {
    const Delivery delivery = std::move(once->second.front());
    once->second.pop_front();
    rooms.push_back(buffer.size());
    if (delivery.error != 0) return {delivery.error, 0};
    const std::size_t length = std::min(buffer.size(), delivery.bytes.size());
    std::copy_n(delivery.bytes.begin(), length, buffer.begin());
    return {0, length};
  }
  const auto found = integers.find(name);
  if (found == integers.end()) return {ENOENT, 0};
  const std::size_t length = std::min<std::size_t>(buffer.size(), 8);
  std::copy_n(base::littleEndianBytes(found->second).begin(), length, buffer.begin());
  return {0, length};
}

void FakeNetworkUsage::queryAllProcesses(Reply reply) {
  if (repliesAtOnce) return reply(records ? &*records : nullptr);
  pending.push_back(std::move(reply));
}

std::vector<ReportChannel> FakeReportingChannels::copyChannels(std::uint64_t categoryMask) {
  std::vector<ReportChannel> channels;
  if ((categoryMask & category) == 0) return channels;
  for (const ChannelSample& sample : samples) channels.push_back(sample.channel);
  return channels;
}

std::unique_ptr<ChannelSubscription> FakeReportingChannels::subscribe(
    const std::vector<ReportChannel>& channels) {
  struct Subscription : ChannelSubscription {
    explicit Subscription(FakeReportingChannels& f) : facility(f) {}
    FakeReportingChannels& facility;
    std::optional<std::vector<ChannelSample>> createSamples() override {
      return facility.delivers ? std::optional(facility.samples) : std::nullopt;
    }
  };
  subscribed.clear();
  for (const ReportChannel& channel : channels) subscribed.push_back(channel.name);
  return subscribes ? std::make_unique<Subscription>(*this) : nullptr;
}

FakePlatform::FakePlatform(LogLevel lowest)
    : log(lowest),
      platform{.log = log,
               .streams = streams,
               .clock = clock,
               .files = files,
               .counters = counters,
               .history = history,
               .preferences = preferences,
               .analyticsConfiguration = preferences,
               .privilegedPreferences = preferences,
               .submission = submission,
               .faultwatch = housekeeping,
               .servitaLogs = housekeeping,
               .eventLoop = service,
               .namedServices = service,
               .notifications = service,
               .eventra = eventra,
               .deviceProperties = device,
               .systemVersion = device,
               .kernel = kernel,
               .snapshots = snapshots,
               .registry = registry,
               .drivers = registry,
               .purgeableSpace = purgeableSpace,
               .reportingChannels = reportingChannels,
               .networkUsage = networkUsage,
               .applications = device,
               .locale = device,
               .libraries = device,
               .runLock = runLock,
               .outbox = outbox} {}

}  // namespace platform::fakes
