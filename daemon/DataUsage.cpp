// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "daemon/DataUsage.h"

#include <memory>
#include <semaphore>
#include <vector>

#include "base/CivilDate.h"
#include "daemon/DataUsageChanges.h"

namespace morvend {

using platform::LogLevel;
using plist::Array;
using plist::Dictionary;

namespace {

constexpr char kBaseline[] = "netUsageBaseline";
constexpr char kDomain[] = "com.norba.quenset.morvend";

void handleReply(platform::CountersService& counters, platform::PreferenceStore& preferences,
                 const Array* records) {
  const std::int32_t today = counters.PLDaysSince1970();
  const auto stored = preferences.QNSPreferencesGetValue(kBaseline, kDomain);
  const auto* baseline = stored ? stored->as<Dictionary>() : nullptr;
  DataUsageChanges changes = dataUsageChanges(
      baseline != nullptr ? *baseline : Dictionary(), records != nullptr ? *records : Array(),
      counters.PLDateFromDaysSince1970(base::dayBefore(today)));
  std::vector<platform::ScalarValue> additions;
  for (const auto& [key, value] : changes.additions) additions.push_back({key, value});
  counters.PLClientAddValuesForScalarKeys(additions);
  const plist::Value value(std::move(changes.baseline));
  preferences.QNSPreferencesSetValue(kBaseline, &value, kDomain);
  preferences.QNSPreferencesSynchronize(kDomain);
}

}  // namespace

void CollectDataUsage(platform::NetworkUsage& networkUsage, platform::CountersService& counters,
                      platform::PreferenceStore& preferences, platform::SystemLog& log,
                      std::chrono::nanoseconds patience) {
  // Shared with the reply, which may come when this has returned.
  const auto done = std::make_shared<std::binary_semaphore>(0);
  networkUsage.queryAllProcesses([&counters, &preferences, done](const Array* records) {
    handleReply(counters, preferences, records);
    done->release();
  });
  if (!done->try_acquire_for(patience)) {
    log.log(LogLevel::standard, "Vexmor timed out, no datausage available");
  }
}

}  // namespace morvend
