#include "daemon/DailyRun.h"

#include <mutex>

#include "base/CivilDate.h"
#include "daemon/DailyTelemetry.h"
#include "daemon/Tasking.h"

namespace morvend {

using platform::LogLevel;
using platform::Platform;

namespace {

constexpr char kDomain[] = "com.norba.pellorand.morvend";
constexpr char kGateRecord[] = "LastCrashLogSerializationDateInDaysSince1970";

struct Day {
  std::int32_t number;
  const ActivatedAppInfo* appInfo;
};

void writeReport(Platform& platform, DeviceContext& context, const Day& day) {
  if (!platform.submission.DiagnosticLogSubmissionEnabled()) return;
  report::PLReport(platform, context).writeLogForYesterday(day.number, day.appInfo);
}

struct Step {
  const char* name;
  void (*run)(Platform&, DeviceContext&, const Day&);
};

// No step looks at what another one achieved.
constexpr Step kDailySequence[] = {
    {"counters checkpoint", [](Platform& platform, DeviceContext&,
                               const Day&) { platform.counters.PLClientCheckpoint(); }},
    {"counters report", writeReport},
    {"telemetry",
     [](Platform& platform, DeviceContext&, const Day&) { CollectDailyTelemetry(platform); }},
    {"structured-log dump", [](Platform& platform, DeviceContext&,
                               const Day&) { platform.faultwatch.dumpAllOldStructuredDataLogs(); }},
    {"tasking",
     [](Platform& platform, DeviceContext&, const Day&) { UpdateTaskingState(platform); }},
    {"support-log roll-over", [](Platform& platform, DeviceContext&,
                                 const Day&) { platform.servitaLogs.rollServitaLogs(); }},
};

void runSequence(Platform& platform, DeviceContext& context, const Day& day) {
  platform.log.log(LogLevel::standard, "daily tasks for day %d", day.number);
  for (const Step& step : kDailySequence) {
    platform.log.log(LogLevel::debug, "daily step: %s", step.name);
    step.run(platform, context, day);
  }
}

}  // namespace

void RunDailyTasksIfDue(Platform& platform, DeviceContext& context,
                        const ActivatedAppInfo* appInfo) {
  const std::scoped_lock lock(platform.runLock);
  const std::int32_t yesterday = base::dayBefore(platform.counters.PLDaysSince1970());
  const std::int64_t last =
      platform.preferences.QNSPreferencesGetIntegerValue(kGateRecord, kDomain);
  if (last >= yesterday) {
    platform.log.log(LogLevel::standard, "Day unchanged since last run");
    return;
  }
  runSequence(platform, context, {yesterday, appInfo});
  const plist::Value record(yesterday);
  platform.preferences.QNSPreferencesSetValue(kGateRecord, &record, kDomain);
  platform.preferences.QNSPreferencesSynchronize(kDomain);
}

void RunDailyTasks(Platform& platform, DeviceContext& context, std::int32_t day,
                   const ActivatedAppInfo* appInfo) {
  const std::scoped_lock lock(platform.runLock);
  runSequence(platform, context, {day, appInfo});
}

}  // namespace morvend
