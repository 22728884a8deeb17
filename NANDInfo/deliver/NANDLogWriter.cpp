#include "NANDInfo/NANDLogWriter.h"

#include <exception>
#include <utility>

#include "NANDInfo/deliver/NANDLog.h"
#include "base/CivilDate.h"
#include "platform/Platform.h"

namespace NANDInfo {

using platform::LogLevel;
using platform::Platform;
using plist::Date;
using plist::Value;

namespace {

constexpr char kDomain[] = "com.norba.pellorand.morvend";
constexpr char kLastLoggedKey[] = "SSLastLoggedAt";
constexpr double kInterval = 604800;  // seconds

// A time in the future counts as recent. What is skipped is logged.
bool wasWrittenRecently(Platform& platform, Date now) {
  const auto stored = platform.preferences.QNSPreferencesGetValue(kLastLoggedKey, kDomain);
  const Date* last = stored ? stored->as<Date>() : nullptr;
  if (last == nullptr || !(now.secondsSince1970 - last->secondsSince1970 < kInterval)) return false;
  platform.log.log(LogLevel::standard, "NANDLogWriter:Last written at %s current %s :skipped",
                   description(*stored).c_str(), description(Value(now)).c_str());
  return true;
}

NANDLogOrigin originAt(Platform& platform, Date now) {
  auto process = platform.kernel.process();
  return {.systemIdentifier = platform.deviceProperties.textProperty("SystemIdentifier"),
          .hardwareModel = platform.deviceProperties.textProperty("HardwareModel"),
          .operatingSystemVersion = platform.systemVersion.operatingSystemVersion(),
          .date = NANDLogDate(now, platform.clock.secondsFromUTC(now)),
          .incidentIdentifier = platform.faultwatch.newIncidentIdentifier(),
          .faultwatchKey = GetFaultwatchKey(platform),
          .processName = std::move(process.name),
          .processIdentifier = process.identifier};
}

base::CivilDate currentDate(Platform& platform) {
  return base::civilFromSeconds(platform.clock.now().secondsSince1970).date;
}

}  // namespace

void NLW_WriteLog(Platform& platform, std::string_view logType, const plist::Dictionary* values) {
  try {
    const Date now = platform.clock.now();
    if (wasWrittenRecently(platform, now) || values == nullptr) return;
    const std::string text = NANDLogText(originAt(platform, now), NANDLogEntries(*values));
    platform.submission.QNSWriteLogForSubmission(
        logType, "StorageStatus", nullptr,
        [&text](platform::LogHandle& handle) { handle.write(text); });
    const Value written(now);
    platform.preferences.QNSPreferencesSetValue(kLastLoggedKey, &written, kDomain);
    platform.preferences.QNSPreferencesSynchronize(kDomain);
  } catch (const std::exception& exception) {
    platform.log.log(LogLevel::standard, "An exception occurred: %s", exception.what());
  }
}

std::string GetFaultwatchKey(Platform& platform) {
  return platform.deviceProperties.textProperty("InverseDeviceID").value_or("error");
}

int GetCurrentMonthNumber(Platform& platform) { return currentDate(platform).month; }

std::int64_t GetCurrentYear(Platform& platform) { return currentDate(platform).year; }

}  // namespace NANDInfo
