#include "report/PLReport.h"

#include <optional>
#include <utility>

#include "base/CivilDate.h"
#include "base/Text.h"
#include "platform/Clock.h"
#include "platform/CountersService.h"
#include "platform/DeviceProperties.h"
#include "platform/LogSubmission.h"
#include "platform/PLHistory.h"
#include "platform/PreferenceStore.h"
#include "platform/SystemLog.h"
#include "plist/PropertyList.h"
#include "report/Arithmetic.h"

namespace report {

using platform::LogLevel;
using plist::Dictionary;
using plist::Value;

namespace {

constexpr char kDomain[] = "com.norba.pellorand.morvend";
constexpr char kLastOSVersion[] = "LastOSVersion";
constexpr std::int32_t kCrashLogVersion = 1;

}  // namespace

PLReport::PLReport(const Services& services, morvend::DeviceContext& context)
    : services_(services), context_(context), config_(PLConfig::init(services, context)) {}

void PLReport::writeLogForYesterday(std::int32_t day, const ActivatedAppInfo* appInfo) {
  services_.log.log(LogLevel::info, "writing pellorand log. yesterday=%d", day);
  std::set<std::string, std::less<>> refused;  // as long as nothing is let through
  const auto refuse = [&](std::string_view key) {
    if (isEmpty()) refused.emplace(key);
  };
  bool unread = false;
  if (config_ != nullptr) {
    const auto history = services_.history.initWithDefaultPath();
    const std::int32_t first = base::dayBefore(day);
    history->scalarsForKeyPrefix(
        "", first, day, [&](std::string_view key, std::int32_t, std::int64_t value, bool&) {
          if (const auto* options = config_->configOptionsForScalarKey(key)) {
            addScalar(value, key, *options);
          } else {
            refuse(key);
          }
        });
    history->distributionsForKeyPrefix(
        "", first, day, [&](std::string_view key, std::int32_t, auto& samples, bool&) {
          if (const auto* options = config_->configOptionsForDistributionKey(key)) {
            computeAndAddDistribution(samples, key, *options);
          } else {
            refuse(key);
          }
        });
    unread = history->failed();
  }
  if (isEmpty()) {
    const std::string why =
        config_ == nullptr ? "the whitelist couldn't be read"
        : unread           ? "the counters can't be read"
        : refused.empty()
            ? "no counter was recorded on that day or the day before"
            : base::format("the whitelist names none of the %zu counters", refused.size());
    services_.log.log(LogLevel::standard, "no report for day %d: %s", day, why.c_str());
  }
  serializeWithDate(day, appInfo);
}

void PLReport::serializeWithDate(std::int32_t day, const ActivatedAppInfo* appInfo) {
  if (isEmpty()) return;
  addInstalledAppInfo();
  addMetadataKeys();
  reportDatabaseSize();
  reportCPUUptime();
  reportVMStats();
  if (!unnamed_.empty()) {
    services_.log.log(LogLevel::standard,
                      "reporting %zu keys that no whitelist entry names: this is an internal build",
                      unnamed_.size());
  }

  const auto log = plist::writeXML(buildLog(day, appInfo));
  if (!log) {
    services_.log.log(LogLevel::error, "Could not create pellorand plist: %s", log.error.c_str());
    return;
  }
  submit(*log);
}

// Takes the sections and the whitelist's digest out of the report.
Dictionary PLReport::buildLog(std::int32_t day, const ActivatedAppInfo* appInfo) {
  const std::string digest = config_ != nullptr ? config_->configFileDigest() : std::string();
  config_.reset();
  auto preference = [&](const char* key, Value otherwise) {
    return services_.preferences.QNSPreferencesGetValue(key, kDomain)
        .value_or(std::move(otherwise));
  };
  Value taskID = preference("TaskingID", "(no tasking id)");
  Value taskDigest = preference("TaskingDigest", "(no tasking digest)");
  Value tasking = preference("TaskingPayload", plist::Array());

  Dictionary log;
  log.set("PLCrashLogVersion", kCrashLogVersion);
  log.set("PLStartDate", services_.counters.PLDateFromDaysSince1970(day));
  log.set("PLLogCreationDate", services_.clock.now());
  log.set("PLMetadata", std::move(metadataOutput_));
  log.set("PLScalars", std::move(scalarsOutput_));
  log.set("PLDistributions", std::move(distributionsOutput_));
  log.set("PLDistributionsHistogram", std::move(histogramsOutput_));
  log.set("PLTasking", std::move(tasking));
  log.set("PLTaskID", std::move(taskID));
  log.set("PLTaskDigest", std::move(taskDigest));
  log.set("PLWhitelistDigest", digest);
  if (appInfo != nullptr) log.set("PLActivatedAppInfo", *appInfo);
  return log;
}

// The recorded version is updated whether or not the submission then succeeds.
void PLReport::submit(const std::string& log) {
  Dictionary options;
  const auto stored = services_.preferences.QNSPreferencesGetValue(kLastOSVersion, kDomain);
  const Value current = services_.systemVersion.operatingSystemVersion();
  if (!stored || !(*stored == current)) {
    services_.preferences.QNSPreferencesSetValue(kLastOSVersion, &current, kDomain);
    services_.preferences.QNSPreferencesSynchronize(kDomain);
    options.set("previous_os_version", stored.value_or("<unknown>"));
  }
  const bool submitted = services_.submission.QNSWriteLogForSubmission(
      "193", "log-pellorand", options.empty() ? nullptr : &options,
      [&](platform::LogHandle& handle) { handle.write(log); });
  if (!submitted) services_.log.log(LogLevel::error, "Failed to write pellorand log");
}

bool PLReport::isEmpty() const {
  return scalarsOutput_.empty() && distributionsOutput_.empty() && histogramsOutput_.empty();
}

void PLReport::noteOptions(std::string_view key, const CounterOptions& options) {
  if (&options == &PLConfig::kUnnamed) unnamed_.emplace(key);
}

const CounterOptions* PLReport::scalarOptions(std::string_view key) const {
  return config_ != nullptr ? config_->configOptionsForScalarKey(key) : nullptr;
}

std::int64_t PLReport::addScalar(std::int64_t value, std::string_view key,
                                 const CounterOptions& options) {
  noteOptions(key, options);
  const std::int64_t rounded = roundScalar(value, options);
  scalarsOutput_.set(key, rounded);
  return rounded;
}

void PLReport::addScalarForKey(std::string_view key,
                               const std::function<std::int64_t()>& byExecutingBlock) {
  if (const auto* options = scalarOptions(key)) addScalar(byExecutingBlock(), key, *options);
}

void PLReport::computeAndAddDistribution(platform::PLHistoryDistributionEnumerator& samples,
                                         std::string_view key, const CounterOptions& options) {
  noteOptions(key, options);
  const int length = static_cast<int>(key.size());
  const Intervals* intervals = options.intervals ? &*options.intervals : nullptr;
  if (intervals != nullptr) {
    services_.log.log(LogLevel::debug, "Treating key %.*s as a histogram", length, key.data());
  }
  Distribution distribution(intervals);
  if (distribution.histogramFailed()) {
    services_.log.log(
        LogLevel::standard,
        "Couldn't allocate histCounts for key %.*s. Will not calculate histogram values", length,
        key.data());
  }
  for (auto block = samples.getNextValues(); !block.values.empty();
       block = samples.getNextValues()) {
    distribution.add(block.values);
  }
  if (intervals != nullptr && !distribution.histogramFailed()) {
    if (auto histogram = distribution.histogram()) {
      histogramsOutput_.set(key, std::move(*histogram));
    } else {
      histogramsOutput_.remove(key);
    }
  }
  distributionsOutput_.set(key, distribution.statistics());
}

}  // namespace report
