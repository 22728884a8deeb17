// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/demo/TelemetryRules.h"

#include <set>

#include "NANDInfo/Events.h"
#include "NANDInfo/KeyMap.h"
#include "NANDInfo/Whitelists.h"
#include "base/Text.h"

namespace demo {

namespace {

constexpr char kStorage[] = "com.norba.NANDInfo.";
constexpr char kFixed[] = "fixed list of the step", kMapped[] = "key map";

// What the telemetry sets, by the beginnings of its keys.
constexpr struct {
  const char *prefix, *step, *rule;
} kCounters[] = {{"com.norba.tarvenn.DiskUsageUser", "disk usage", kFixed},
                 {kStorage, "storage health", kFixed},
                 {"TLM_VMFreezer_", "storage health", kFixed},
                 {"datausage.", "data usage", "what the processes used"},
                 {"com.norba.velquist.", "report channels", "the simple channels"}};

bool isKeyMapped(std::string_view key) {
  static const auto keys = [] {
    std::set<std::string_view> names;
    for (const auto& [counter, name] : NANDInfo::keyMapEntries()) names.insert(name);
    return names;
  }();
  return keys.contains(key);
}

}  // namespace

std::optional<CounterRule> counterRule(std::string_view key) {
  for (const auto& [prefix, step, rule] : kCounters) {
    if (key.starts_with(prefix)) return CounterRule{step, isKeyMapped(key) ? kMapped : rule};
  }
  return std::nullopt;
}

std::string nandLogRule(std::string_view key) {
  if (key.starts_with("ValidityList[")) return "nothing: a list as the controller has it";
  return isKeyMapped(key) ? kMapped : kFixed;
}

std::string eventRule(std::string_view event) {
  const NANDInfo::NameTable* fields = NANDInfo::EventraConfigDetails(event);
  if (fields == nullptr) return kFixed;
  const bool magazine = event.starts_with("com.norba.massStorage.NANDInfo.SM.");
  return base::format("%s whitelist, list of %zu", magazine ? "magazine" : "storage",
                      fields->size());
}

}  // namespace demo
