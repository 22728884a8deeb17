// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "report/DailyLog.h"

#include <utility>

#include "platform/Clock.h"
#include "platform/CountersService.h"
#include "platform/DeviceProperties.h"
#include "platform/LogSubmission.h"
#include "platform/Names.h"
#include "platform/PreferenceStore.h"
#include "platform/SystemLog.h"

namespace report {

using plist::Dictionary;
using plist::Value;

namespace {

constexpr char kLastOSVersion[] = "LastOSVersion";
constexpr std::int32_t kCrashLogVersion = 1;

}  // namespace

LogHeader headerForDay(const Services& services, std::int32_t day, std::string whitelistDigest) {
  const auto preference = [&](const char* key, Value otherwise) {
    return services.preferences.QNSPreferencesGetValue(key, platform::kDaemonName)
        .value_or(std::move(otherwise));
  };
  Value taskID = preference("TaskingID", "(no tasking id)");
  Value taskDigest = preference("TaskingDigest", "(no tasking digest)");
  Value tasking = preference("TaskingPayload", plist::Array());
  return {.tasking = std::move(tasking),
          .taskID = std::move(taskID),
          .taskDigest = std::move(taskDigest),
          .start = services.counters.PLDateFromDaysSince1970(day),
          .creation = services.clock.now(),
          .whitelistDigest = std::move(whitelistDigest)};
}

Dictionary buildLog(LogHeader header, Sections sections, const ActivatedAppInfo* appInfo) {
  Dictionary log;
  log.set("PLCrashLogVersion", kCrashLogVersion);
  log.set("PLStartDate", header.start);
  log.set("PLLogCreationDate", header.creation);
  log.set("PLMetadata", std::move(sections.metadata));
  log.set("PLScalars", std::move(sections.scalars));
  log.set("PLDistributions", std::move(sections.distributions));
  log.set("PLDistributionsHistogram", std::move(sections.histograms));
  log.set("PLTasking", std::move(header.tasking));
  log.set("PLTaskID", std::move(header.taskID));
  log.set("PLTaskDigest", std::move(header.taskDigest));
  log.set("PLWhitelistDigest", std::move(header.whitelistDigest));
  if (appInfo != nullptr) log.set("PLActivatedAppInfo", *appInfo);
  return log;
}

bool submitLog(const Services& services, const std::string& log) {
  Dictionary options;
  const auto stored =
      services.preferences.QNSPreferencesGetValue(kLastOSVersion, platform::kDaemonName);
  const Value current = services.systemVersion.operatingSystemVersion();
  if (!stored || !(*stored == current)) {
    services.preferences.QNSPreferencesSetValue(kLastOSVersion, &current, platform::kDaemonName);
    services.preferences.QNSPreferencesSynchronize(platform::kDaemonName);
    options.set("previous_os_version", stored.value_or("<unknown>"));
  }
  const bool submitted = services.submission.QNSWriteLogForSubmission(
      "193", "log-pellorand", options.empty() ? nullptr : &options,
      [&](platform::LogHandle& handle) { handle.write(log); });
  if (!submitted) {
    services.log.log(platform::LogLevel::error, "Failed to write pellorand log");
  }
  return submitted;
}

}  // namespace report
