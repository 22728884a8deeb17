// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Usage records and the baseline before them: what they add to the counters, and that a run which
// is ended at any point adds it once.

#include <cmath>
#include <cstdint>
#include <optional>
#include <set>
#include <string>

#include "Input.h"
#include "daemon/DataUsage.h"
#include "platform/NetworkUsage.h"
#include "platform/testing/FakePlatform.h"
#include "plist/PropertyList.h"

namespace {

using fuzz::require;
using plist::Dictionary;

constexpr std::string_view kWords[] = {"bundleName",
                                       "procName",
                                       platform::kUsageSinceKey,
                                       "wifiInBytes",
                                       "wifiOutBytes",
                                       "wwanInBytes",
                                       "wwanOutBytes",
                                       "p",
                                       "q",
                                       "com.norba.p"};
constexpr std::string_view kStems[] = {"wifiInKB.",  "wifiOutKB.", "wwanInKB.",
                                       "wwanOutKB.", "baddata.",   "olddata."};
constexpr char kBaseline[] = "netUsageBaseline", kDomain[] = "com.norba.quenset.morvend";

struct Processes {
  std::set<std::string> names, shown;  // in the baseline, and in the keys
  bool apart = true;                   // no name comes twice
};

Processes processesOf(const plist::Array& records) {
  Processes processes;
  for (const plist::Value& value : records) {
    const auto* record = value.as<Dictionary>();
    if (record == nullptr || record->date(platform::kUsageSinceKey) == nullptr) continue;
    const auto *bundle = record->text("bundleName"), *process = record->text("procName");
    if (bundle == nullptr && process == nullptr) continue;
    const std::string& name = bundle != nullptr ? *bundle : *process;
    processes.apart = processes.names.insert(name).second && processes.apart;
    processes.shown.insert(bundle != nullptr ? name : "com.norba." + name);
  }
  return processes;
}

// "add datausage.<stem><process> <value>"
void checkRecord(const std::string& line, const Processes& processes) {
  constexpr std::string_view kStart = "add datausage.";
  require(line.starts_with(kStart), "additions are of data usage");
  const std::string_view key = std::string_view(line).substr(kStart.size());
  const auto* stem = std::ranges::find_if(kStems, [&](auto some) { return key.starts_with(some); });
  require(stem != std::end(kStems), "each under one of its names");
  const std::size_t end = key.rfind(' ');
  require(processes.shown.contains(std::string(key.substr(stem->size(), end - stem->size()))),
          "of a process that has a record");
  const std::int64_t value = std::stoll(std::string(key.substr(end)));
  const bool counts = stem->ends_with("KB.");
  require(counts ? value != 0 && std::abs(value) <= std::int64_t{1} << 53 : value == 1,
          "there is something to add");
}

// Whether writing changes nothing: fractions and absurd dates don't come back from the file.
bool sameWhenRead(const plist::Array& records) {
  const auto written = plist::writeXML(plist::Value(records));
  const auto read = written ? plist::read(*written).orNone() : std::nullopt;
  return read && *read == plist::Value(records);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  fuzz::Input input(bytes, size);
  fuzz::Values values(input, kWords);
  // The few services that it uses.
  platform::fakes::Journal journal;
  platform::fakes::FakeCounters counters(journal);
  platform::fakes::FakePreferences preferences(journal);
  platform::fakes::FakeNetworkUsage networkUsage;
  platform::fakes::RecordingLog log;
  counters.today = input.number<std::uint8_t>();
  const plist::Value before = values.value();
  preferences.setMobile(kDomain, kBaseline, before);
  const plist::Array records = values.array(16);
  networkUsage.records = records;
  const auto run = [&] {
    counters.records.clear();
    morvend::CollectDataUsage(networkUsage, counters, preferences, log);
  };

  run();
  const Processes processes = processesOf(records);
  for (const std::string& line : counters.records) checkRecord(line, processes);
  require(counters.records.size() <= 5 * records.size(), "each record has its few");
  const auto after = preferences.mobile(kDomain, kBaseline);
  const auto* baseline = after ? after->as<Dictionary>() : nullptr;
  require(baseline != nullptr && baseline->size() == processes.names.size(), "the baseline is new");
  for (const auto& [name, value] : *baseline) {
    const auto* entry = value.as<plist::Array>();
    require(processes.names.contains(name) && entry != nullptr && entry->size() == 5 &&
                entry->front().as<plist::Date>() != nullptr,
            "and has a date and four counts for each process");
  }
  if (!processes.apart || !sameWhenRead(records)) return 0;
  // Ended before the baseline was on disk, and then again with it.
  preferences.setMobile(kDomain, kBaseline, before);
  for (int again = 0; again < 2; ++again) {
    const bool counted = !counters.kept[kBaseline].empty() || again == 1;
    run();
    require(!counted || counters.records.empty(), "what is counted is counted once");
  }
  return 0;
}
