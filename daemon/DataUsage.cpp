// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "daemon/DataUsage.h"

#include <memory>
#include <optional>
#include <semaphore>
#include <string>
#include <vector>

#include "base/CivilDate.h"
#include "daemon/DataUsageChanges.h"
#include "plist/MD5.h"
#include "plist/PropertyList.h"

namespace morvend {

using platform::LogLevel;
using plist::Array;
using plist::Dictionary;
using plist::Value;

namespace {

constexpr char kBaseline[] = "netUsageBaseline";
constexpr char kDomain[] = "com.norba.quenset.morvend";

// Counters and baseline move together. What is counted is recorded together with the baseline that
// it leads to, and with what tells which baseline it began from: the preferences get the new one
// afterwards. A run that finds the one in the preferences counted from already goes on from where
// that led to.
constexpr char kAfter[] = "After", kNext[] = "Baseline";  // in what is kept with the counters

plist::Data identityOf(const Dictionary& baseline) {
  const auto text = plist::writeXML(baseline);
  const auto digest = plist::md5(text ? *text : std::string());
  return {digest.begin(), digest.end()};
}

// What is kept, if it began from the baseline.
std::optional<Dictionary> keptAfter(const std::string& kept, const Dictionary& baseline) {
  auto read = plist::read(kept).orNone();
  const auto* content = read ? read->as<Dictionary>() : nullptr;
  const auto* after = content != nullptr ? content->find(kAfter) : nullptr;
  const auto* next = content != nullptr ? content->dictionary(kNext) : nullptr;
  if (after == nullptr || next == nullptr || *after != Value(identityOf(baseline))) return {};
  return *next;
}

void handleReply(platform::CountersService& counters, platform::PreferenceStore& preferences,
                 platform::SystemLog& log, const Array* records) {
  const auto left = [&log](const base::Error& why) {
    log.log(LogLevel::error, "Data usage is left for the next run: %s", why.text.c_str());
  };
  const std::int32_t today = counters.PLDaysSince1970();
  const auto read = preferences.readValue(kBaseline, kDomain);
  if (!read) return left(read.error());
  const auto* stored = *read ? (*read)->as<Dictionary>() : nullptr;
  const Dictionary baseline = stored != nullptr ? *stored : Dictionary();
  const auto kept = counters.keptText(kBaseline);
  if (!kept) return left(kept.error());

  DataUsageChanges changes = dataUsageChanges(
      keptAfter(*kept, baseline).value_or(baseline), records != nullptr ? *records : Array(),
      counters.PLDateFromDaysSince1970(base::dayBefore(today)));
  std::vector<platform::ScalarValue> additions;
  for (const auto& [key, value] : changes.additions) additions.push_back({key, value});
  const auto next =
      additions.empty()
          ? base::Result<std::string>(std::string())
          : plist::writeXML(Dictionary{{kAfter, identityOf(baseline)}, {kNext, changes.baseline}});
  if (!next) return left(next.error());
  // Without additions nothing has to be kept, unless what is would be taken for the new baseline's.
  const bool keeps = !additions.empty() || keptAfter(*kept, changes.baseline);
  if (keeps && !counters.addValuesAndKeep(additions, kBaseline, *next)) return;
  const Value value(std::move(changes.baseline));
  preferences.QNSPreferencesSetValue(kBaseline, &value, kDomain);
  preferences.QNSPreferencesSynchronize(kDomain);
}

}  // namespace

void CollectDataUsage(platform::NetworkUsage& networkUsage, platform::CountersService& counters,
                      platform::PreferenceStore& preferences, platform::SystemLog& log,
                      std::chrono::nanoseconds patience) {
  // Shared with the reply, which may come when this has returned.
  const auto done = std::make_shared<std::binary_semaphore>(0);
  networkUsage.queryAllProcesses([&counters, &preferences, &log, done](const Array* records) {
    handleReply(counters, preferences, log, records);
    done->release();
  });
  if (!done->try_acquire_for(patience)) {
    log.log(LogLevel::standard, "Vexmor timed out, no datausage available");
  }
}

}  // namespace morvend
