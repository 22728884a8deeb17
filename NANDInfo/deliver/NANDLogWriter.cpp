// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/deliver/NANDLogWriter.h"

#include <exception>
#include <utility>

#include "NANDInfo/deliver/NANDLog.h"
#include "platform/Clock.h"
#include "platform/DeviceProperties.h"
#include "platform/FaultwatchSupport.h"
#include "platform/Kernel.h"
#include "platform/LogSubmission.h"
#include "platform/Names.h"
#include "platform/PreferenceStore.h"
#include "platform/SystemLog.h"

namespace NANDInfo {

using platform::LogLevel;
using plist::Date;
using plist::Value;

namespace {

constexpr char kLastLoggedKey[] = "SSLastLoggedAt";
constexpr double kInterval = 604800;  // seconds

// A time in the future counts as recent. What is skipped is logged.
bool wasWrittenRecently(platform::PreferenceStore& preferences, platform::SystemLog& systemLog,
                        Date now) {
  const auto stored = preferences.QNSPreferencesGetValue(kLastLoggedKey, platform::kDaemonName);
  const Date* last = stored ? stored->as<Date>() : nullptr;
  if (last == nullptr || !(now.secondsSince1970 - last->secondsSince1970 < kInterval)) return false;
  systemLog.log(LogLevel::standard, "NANDLogWriter:Last written at %s current %s :skipped",
                description(*stored).c_str(), description(Value(now)).c_str());
  return true;
}

NANDLogOrigin originAt(const Services& services, Date now) {
  auto process = services.kernel.process();
  return {.systemIdentifier = services.deviceProperties.textProperty("SystemIdentifier"),
          .hardwareModel = services.deviceProperties.textProperty("HardwareModel"),
          .operatingSystemVersion = services.systemVersion.operatingSystemVersion(),
          .date = NANDLogDate(now, services.clock.secondsFromUTC(now)),
          .incidentIdentifier = services.faultwatch.newIncidentIdentifier(),
          .faultwatchKey = faultwatchKey(services.deviceProperties),
          .processName = std::move(process.name),
          .processIdentifier = process.identifier};
}

}  // namespace

void writeNANDLog(const Services& services, std::string_view logType,
                  const plist::Dictionary* values) {
  try {
    const Date now = services.clock.now();
    if (wasWrittenRecently(services.preferences, services.log, now) || values == nullptr) return;
    const std::string text = NANDLogText(originAt(services, now), NANDLogEntries(*values));
    services.submission.QNSWriteLogForSubmission(
        logType, "StorageStatus", nullptr,
        [&text](platform::LogHandle& handle) { handle.write(text); });
    const Value written(now);
    services.preferences.QNSPreferencesSetValue(kLastLoggedKey, &written, platform::kDaemonName);
    services.preferences.QNSPreferencesSynchronize(platform::kDaemonName);
  } catch (const std::exception& exception) {
    services.log.log(LogLevel::standard, "An exception occurred: %s", exception.what());
  }
}

std::string faultwatchKey(platform::DeviceProperties& properties) {
  return properties.textProperty("InverseDeviceID").value_or("error");
}

base::CivilDate currentDate(platform::Clock& clock) {
  return base::civilFromSeconds(clock.now().secondsSince1970).date;
}

}  // namespace NANDInfo
