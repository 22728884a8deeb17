// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// A platform in memory, for tests: every service answers from plain members and writes down what
// was asked of it.
#pragma once

#include <deque>
#include <functional>
#include <map>
#include <memory>
#include <optional>
#include <set>
#include <span>
#include <string>
#include <string_view>
#include <tuple>
#include <utility>
#include <vector>

#include "base/Result.h"
#include "platform/AllServices.h"
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
#include "platform/ServitaLogs.h"
#include "platform/StandardStreams.h"
#include "platform/SystemLog.h"
#include "platform/testing/FakeDeviceRegistry.h"
#include "platform/testing/FakeRun.h"
#include "platform/testing/RecordingLog.h"

namespace platform::fakes {

// What happened outside the process, in order, across all services: "checkpoint",
// "synchronize <domain>", "post <notification>" and so on.
using Journal = std::vector<std::string>;

class FakeClock : public Clock {
 public:
  double secondsSince1970 = 0;
  std::int32_t zone = 0;  // seconds ahead of UTC
  plist::Date now() override { return {secondsSince1970}; }
  std::int32_t secondsFromUTC(plist::Date) override { return zone; }
};

class FakeFileSystem : public FileSystem {
 public:
  std::map<std::string, std::string, std::less<>> contents;
  std::map<std::string, Statistics, std::less<>> volumes;  // by the path that is asked for
  std::optional<std::uint64_t> fileStatus(std::string_view path) override;
  std::optional<Statistics> statfs(std::string_view path) override;
  std::optional<std::string> readFile(std::string_view path, std::size_t maximum) override;
};

class FakeCounters : public CountersService {
 public:
  explicit FakeCounters(Journal& journal) : journal_(journal) {}
  std::int32_t today = 0;
  std::int32_t PLDaysSince1970() override { return today; }
  plist::Date PLDateFromDaysSince1970(std::int32_t day) override { return {day * 86400.0}; }
  void PLClientCheckpoint() override { journal_.push_back("checkpoint"); }

  // What was recorded, in order: "set <key> <value>", "add <key> <value>".
  std::vector<std::string> records;
  bool areInJournal = false;  // there, too
  void PLClientSetValueForScalarKey(std::string_view key, std::int64_t value) override {
    record("set " + std::string(key) + " " + std::to_string(value));
  }
  void PLClientAddValueForScalarKey(std::string_view key, std::int64_t value) override {
    record("add " + std::string(key) + " " + std::to_string(value));
  }

  bool refuses = false;  // to keep, and to say what is kept
  std::map<std::string, std::string, std::less<>> kept;
  bool addValuesAndKeep(std::span<const ScalarValue> values, std::string_view name,
                        std::string_view text) override {
    if (refuses) return false;
    PLClientAddValuesForScalarKeys(values);
    kept[std::string(name)] = text;
    return true;
  }
  base::Result<std::string> keptText(std::string_view name) override {
    if (refuses) return base::Error{"refused"};
    return kept[std::string(name)];
  }

 private:
  void record(std::string text) {
    if (areInJournal) journal_.push_back(text);
    records.push_back(std::move(text));
  }

  Journal& journal_;
};

// Rows are delivered in the order of the maps: by day, then by key.
class FakeHistory : public HistoryStore {
 public:
  using RowKey = std::pair<std::int32_t, std::string>;
  std::map<RowKey, std::int64_t> scalars;
  std::map<RowKey, std::vector<double>> distributions;
  std::size_t blockSize = 3;                      // samples handed over at a time
  base::Result<void> outcome;                     // of a query, after its rows
  std::vector<base::Result<void>> firstOutcomes;  // of the next queries, instead of that

  base::Result<void> nextOutcome();
  std::unique_ptr<PLHistory> initWithDefaultPath() override;
};

class FakePreferences : public PreferenceStore,
                        public AnalyticsConfiguration,
                        public PrivilegedPreferences {
 public:
  explicit FakePreferences(Journal& journal) : journal_(journal) {}

  // By user, domain and key.
  std::map<std::tuple<std::string, std::string, std::string>, plist::Value> values;

  std::optional<plist::Value> mobile(std::string_view domain, std::string_view key) const;
  void setMobile(std::string_view domain, std::string_view key, plist::Value value);

  std::optional<plist::Value> QNSPreferencesGetValue(std::string_view key,
                                                     std::string_view domain) override;
  void QNSPreferencesSetValue(std::string_view key, const plist::Value* value,
                              std::string_view domain) override;
  void QNSPreferencesSynchronize(std::string_view domain) override;
  bool readable = true;  // for who asks whether a value can be read
  base::Result<std::optional<plist::Value>> readValue(std::string_view key,
                                                      std::string_view domain) override;
  std::optional<plist::Value> getPreference(std::string_view key, std::string_view domain) override;
  void setPreference(std::string_view key, const plist::Value* value, std::string_view domain,
                     bool synchronize) override;
  std::vector<std::string> blocklist;
  std::vector<std::string> logBlocklist() override { return blocklist; }
  void setPreference(std::string_view key, std::string_view user, std::string_view domain,
                     const plist::Value* value) override;
  void deletePreference(std::string_view key, std::string_view user,
                        std::string_view domain) override;

 private:
  void write(std::string_view user, std::string_view domain, std::string_view key,
             const plist::Value* value);

  Journal& journal_;
};

class FakeSubmission : public LogSubmission {
 public:
  struct Log {
    std::string type, name, contents;
    std::optional<plist::Dictionary> options;
  };

  explicit FakeSubmission(Journal& journal) : journal_(journal) {}
  bool allowed = true, accepts = true;
  std::vector<Log> logs;
  std::function<void()> beforeLog = [] {};  // may throw
  std::function<void()> asked = [] {};      // before the answer whether it is allowed

  bool DiagnosticLogSubmissionEnabled() override {
    asked();
    return allowed;
  }
  bool QNSWriteLogForSubmission(std::string_view logType, std::string_view logName,
                                const plist::Dictionary* options, const Writer& writer) override;

 private:
  Journal& journal_;
};

class FakeHousekeeping : public FaultwatchSupport, public ServitaLogs {
 public:
  explicit FakeHousekeeping(Journal& journal) : journal_(journal) {}
  std::vector<std::pair<std::int32_t, plist::Dictionary>> structured;  // type and data of each log
  void logStructuredData(std::int32_t type, const plist::Dictionary& data) override;
  void dumpAllOldStructuredDataLogs() override { journal_.push_back("dump structured logs"); }
  std::string newIncidentIdentifier() override { return "incident"; }
  void rollServitaLogs() override { journal_.push_back("roll servita logs"); }

 private:
  Journal& journal_;
};

// An event loop that follows a script: each run takes the next step, and times out when none is
// left.
class FakeService : public EventLoop, public NamedServices, public NotificationCenter {
 public:
  explicit FakeService(Journal& journal) : journal_(journal) {}
  bool registers = true;
  std::deque<std::function<RunResult()>> script;

  // Scripts the delivery of a message, or of an event that isn't one.
  void willDeliver(std::optional<plist::Dictionary> message);

  RunResult run(double seconds, bool returnAfterSourceHandled) override;
  std::unique_ptr<NamedServiceListener> listen(std::string_view serviceName) override;
  void postNotification(std::string_view name) override {
    journal_.push_back("post " + std::string(name));
  }

 private:
  class Listener;

  Journal& journal_;
  NamedServiceListener::EventHandler handler_;
};

class FakeEventra : public Eventra {
 public:
  bool hasLazySend = true, everyEventIsUsed = true, queuesEvents = true;
  std::set<std::string, std::less<>> unused;  // events that aren't used even so
  bool defers = false;                        // leaves what is sent to deliver()
  std::vector<std::pair<std::string, plist::Dictionary>> events;

  // Asks the producers that still wait for their payloads, on a thread of its own.
  void deliver();

  bool offersLazySend() override { return hasLazySend; }
  bool EventraIsEventUsed(std::string_view event) override {
    return everyEventIsUsed && !unused.contains(event);
  }
  bool EventraSendEventLazy(std::string_view event, PayloadProducer producer) override;

 private:
  std::vector<std::pair<std::string, PayloadProducer>> waiting_;
};

class FakeDevice : public DeviceProperties,
                   public SystemVersion,
                   public InstalledApplications,
                   public LocaleService,
                   public LibraryLoader {
 public:
  bool internalBuild = false;
  int internalBuildQueries = 0;
  std::map<std::string, std::string, std::less<>> texts;  // properties
  std::optional<std::uint32_t> multiUser = 0;
  std::optional<std::string> container;
  std::uint64_t containerError = 2;
  int containerQueries = 0;
  std::optional<plist::Dictionary> version;
  std::string versionText;
  std::vector<BundleType> bundles;
  int enumerations = 0;
  std::vector<std::string> languages, localizations, matches;
  std::optional<std::string> country;
  std::map<std::string, void*> symbols;  // of the one library that loads
  bool libraryLoads = true;
  int loads = 0;

  std::optional<DiskUsage> usage;
  std::optional<DiskUsage> diskUsage() override { return usage; }
  bool booleanProperty(std::string_view name) override;
  std::optional<std::string> textProperty(std::string_view name) override;
  std::optional<std::uint32_t> multiUserIndicator() override { return multiUser; }
  GroupContainer systemGroupContainerPath(std::string_view identifier) override;
  std::optional<plist::Dictionary> systemVersionDictionary() override { return version; }
  std::string operatingSystemVersion() override { return versionText; }
  void enumerateBundles(const std::function<void(BundleType)>& handler) override;
  std::vector<std::string> preferredLanguages() override { return languages; }
  std::vector<std::string> systemLocalizations() override { return localizations; }
  std::vector<std::string> bestMatch(const std::vector<std::string>&,
                                     const std::vector<std::string>&) override {
    return matches;
  }
  std::optional<std::string> countryCode() override { return country; }
  void* load(std::string_view path) override;
  void* symbol(void* library, const char* name) override;
};

// Integers are delivered little-endian, in the buffer's width up to 8 bytes; a name that isn't
// there fails with ENOENT.
class FakeKernel : public Kernel {
 public:
  std::map<std::string, std::uint64_t, std::less<>> integers;
  std::vector<std::string> reads;  // the names asked for, in order
  std::uint64_t bytesPerPage = 4096, ticks = 0;
  std::optional<Timebase> ratio = Timebase{1, 1};
  Process running{"morvend", 77};

  // Values that are delivered once each, before the integers: what each read gets.
  struct Delivery {
    int error = 0;
    std::vector<std::byte> bytes;
  };
  std::map<std::string, std::deque<Delivery>, std::less<>> deliveries;
  std::vector<std::size_t> rooms;  // the buffers' sizes of these reads

  ReadResult sysctlbyname(std::string_view name, std::span<std::byte> buffer) override;
  std::uint64_t pageSize() override { return bytesPerPage; }
  std::uint64_t absoluteTime() override { return ticks; }
  std::optional<Timebase> timebase() override { return ratio; }
  Process process() override { return running; }
};

class FakeSnapshots : public KernelSnapshots {
 public:
  std::optional<std::vector<std::byte>> snapshot;
  std::uint32_t flags = 0;  // of the last capture
  std::optional<std::vector<std::byte>> capture(std::uint32_t wanted) override {
    flags = wanted;
    return snapshot;
  }
};

class FakePurgeableSpace : public PurgeableSpace {
 public:
  bool present = false;
  std::optional<plist::Dictionary> answer;
  plist::Dictionary lastQuery;
  bool isPresent() override { return present; }
  std::optional<plist::Dictionary> SpacereapCopyItemizedPurgeableSpaceWithInfo(
      const plist::Dictionary& query) override {
    lastQuery = query;
    return answer;
  }
};

// Replies within the query, or leaves the replies to the test.
class FakeNetworkUsage : public NetworkUsage {
 public:
  std::optional<plist::Array> records;
  bool repliesAtOnce = true;
  std::vector<Reply> pending;
  void queryAllProcesses(Reply reply) override;
};

class FakeReportingChannels : public ReportingChannels {
 public:
  std::vector<ChannelSample> samples;  // of all channels; they are all of one category
  std::uint64_t category = 0x100;
  bool subscribes = true, delivers = true;
  std::vector<std::string> subscribed;  // the names of the channels last subscribed to
  std::vector<ReportChannel> copyChannels(std::uint64_t categoryMask) override;
  std::unique_ptr<ChannelSubscription> subscribe(
      const std::vector<ReportChannel>& channels) override;
};

class FakeStreams : public StandardStreams {
 public:
  std::vector<std::string> errors;
  std::string output;
  void writeError(std::string_view text) override { errors.emplace_back(text); }
  void writeOutput(std::string_view text) override { output += text; }
};

// All of them, assembled.
class FakePlatform {
 public:
  explicit FakePlatform(LogLevel lowest = LogLevel::debug);

  Journal journal;
  RecordingLog log;
  FakeStreams streams;
  FakeClock clock;
  FakeFileSystem files;
  FakeCounters counters{journal};
  FakeHistory history;
  FakePreferences preferences{journal};
  FakeSubmission submission{journal};
  FakeHousekeeping housekeeping{journal};
  FakeService service{journal};
  FakeEventra eventra;
  FakeDevice device;
  FakeKernel kernel;
  FakeSnapshots snapshots;
  FakeDeviceRegistry registry;
  FakePurgeableSpace purgeableSpace;
  FakeReportingChannels reportingChannels;
  FakeNetworkUsage networkUsage;
  FakeRunLock runLock;
  FakeOutbox outbox;
  AllServices platform;
};

}  // namespace platform::fakes
