#include "daemon/DataUsage.h"

#include <memory>
#include <semaphore>
#include <vector>

#include "base/CivilDate.h"
#include "daemon/DataUsageChanges.h"
#include "platform/CountersService.h"
#include "platform/NetworkUsage.h"
#include "platform/PreferenceStore.h"
#include "platform/SystemLog.h"

namespace morvend {

using platform::LogLevel;
using plist::Array;
using plist::Dictionary;

namespace {

constexpr char kBaseline[] = "netUsageBaseline";
constexpr char kDomain[] = "com.norba.quenset.morvend";

void handleReply(const Services& services, const Array* records) {
  const std::int32_t today = services.counters.PLDaysSince1970();
  const auto stored = services.preferences.QNSPreferencesGetValue(kBaseline, kDomain);
  const auto* baseline = stored ? stored->as<Dictionary>() : nullptr;
  DataUsageChanges changes = dataUsageChanges(
      baseline != nullptr ? *baseline : Dictionary(), records != nullptr ? *records : Array(),
      services.counters.PLDateFromDaysSince1970(base::dayBefore(today)));
  std::vector<platform::ScalarValue> additions;
  for (const auto& [key, value] : changes.additions) additions.push_back({key, value});
  services.counters.PLClientAddValuesForScalarKeys(additions);
  const plist::Value value(std::move(changes.baseline));
  services.preferences.QNSPreferencesSetValue(kBaseline, &value, kDomain);
  services.preferences.QNSPreferencesSynchronize(kDomain);
}

}  // namespace

void CollectDataUsage(const Services& services, std::chrono::nanoseconds patience) {
  // Shared with the reply, which may come when this has returned.
  const auto done = std::make_shared<std::binary_semaphore>(0);
  services.networkUsage.queryAllProcesses([services, done](const Array* records) {
    handleReply(services, records);
    done->release();
  });
  if (!done->try_acquire_for(patience)) {
    services.log.log(LogLevel::standard, "Vexmor timed out, no datausage available");
  }
}

}  // namespace morvend
