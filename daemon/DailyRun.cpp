// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "daemon/DailyRun.h"

#include <mutex>
#include <string>

#include "base/CivilDate.h"
#include "daemon/DailyTelemetry.h"
#include "daemon/Tasking.h"
#include "platform/CountersService.h"
#include "platform/FaultwatchSupport.h"
#include "platform/LogSubmission.h"
#include "platform/Names.h"
#include "platform/Outbox.h"
#include "platform/PreferenceStore.h"
#include "platform/RunLock.h"
#include "platform/ServitaLogs.h"
#include "platform/SystemLog.h"

namespace morvend {

using platform::LogLevel;

namespace {

constexpr char kGateRecord[] = "LastCrashLogSerializationDateInDaysSince1970";
constexpr char kLostReport[] = "LostReport";  // the last one, for who asks

struct Day {
  std::int32_t number;
  const ActivatedAppInfo* appInfo;
};

void sayLost(const Services& services, std::int32_t day, const std::string& why) {
  services.log.log(LogLevel::error, "the report of day %d is lost: %s", day, why.c_str());
  const plist::Value lost(plist::Dictionary{{"day", day}, {"why", why}});
  services.preferences.QNSPreferencesSetValue(kLostReport, &lost, platform::kDaemonName);
}

void writeReport(const Services& services, DeviceContext& context, const Day& day) {
  if (services.submission.DiagnosticLogSubmissionEnabled()) {
    const auto written =
        report::PLReport(services.report, context).writeLogForYesterday(day.number, day.appInfo);
    if (!written) sayLost(services, day.number, written.error().text);
  } else if (const auto consent =
                 services.preferences.readValue(platform::kConsentKey, platform::kConsentDomain);
             !consent) {
    sayLost(services, day.number, "the user's consent can't be read");
  }
}

struct Step {
  const char* name;
  void (*run)(const Services&, DeviceContext&, const Day&);
};

// No step looks at what another one achieved.
constexpr Step kDailySequence[] = {
    {"counters checkpoint", [](const Services& services, DeviceContext&,
                               const Day&) { services.counters.PLClientCheckpoint(); }},
    {"counters report", writeReport},
    {"telemetry",
     [](const Services& services, DeviceContext&, const Day&) { CollectDailyTelemetry(services); }},
    {"structured-log dump", [](const Services& services, DeviceContext&,
                               const Day&) { services.faultwatch.dumpAllOldStructuredDataLogs(); }},
    {"tasking",
     [](const Services& services, DeviceContext&, const Day&) { UpdateTaskingState(services); }},
    {"support-log roll-over", [](const Services& services, DeviceContext&,
                                 const Day&) { services.servitaLogs.rollServitaLogs(); }},
};

void runSequence(const Services& services, DeviceContext& context, const Day& day) {
  services.log.log(LogLevel::standard, "daily tasks for day %d", day.number);
  for (const Step& step : kDailySequence) {
    services.log.log(LogLevel::debug, "daily step: %s", step.name);
    step.run(services, context, day);
  }
}

// The last day that was run; 0 when none is recorded.
base::Result<std::int64_t> recordedDay(const Services& services) {
  const auto record = services.preferences.readValue(kGateRecord, platform::kDaemonName);
  if (!record) return record.error();
  const auto* last = *record ? (*record)->as<plist::Number>() : nullptr;
  return last != nullptr ? last->int64Value() : 0;
}

}  // namespace

void RunDailyTasksIfDue(const Services& services, DeviceContext& context,
                        const ActivatedAppInfo* appInfo) {
  const std::scoped_lock lock(services.runLock);
  const std::int32_t yesterday = base::dayBefore(services.counters.PLDaysSince1970());
  const auto last = recordedDay(services);
  if (!last) {
    services.log.log(LogLevel::error,
                     "The record of the last day can't be read, so no day is run: %s",
                     last.error().text.c_str());
    return;
  }
  services.outbox.settle(*last);
  if (*last >= yesterday) {
    services.log.log(LogLevel::standard, "Day unchanged since last run");
    return;
  }
  services.outbox.hold(yesterday);
  runSequence(services, context, {yesterday, appInfo});
  const plist::Value done(yesterday);
  services.preferences.QNSPreferencesSetValue(kGateRecord, &done, platform::kDaemonName);
  services.preferences.QNSPreferencesSynchronize(platform::kDaemonName);
  services.outbox.publish();
}

void RunDailyTasks(const Services& services, DeviceContext& context, std::int32_t day,
                   const ActivatedAppInfo* appInfo) {
  const std::scoped_lock lock(services.runLock);
  // What an earlier run left stays where nobody knows whether its day is recorded.
  if (const auto last = recordedDay(services)) services.outbox.settle(*last);
  services.outbox.hold({});
  runSequence(services, context, {day, appInfo});
  services.outbox.publish();
}

}  // namespace morvend
