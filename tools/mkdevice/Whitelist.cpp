// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/mkdevice/Whitelist.h"

#include <cmath>
#include <string_view>

#include "tools/mkdevice/SampleCounters.h"
#include "tools/mkdevice/Vocabulary.h"

namespace mkdevice {

using plist::Array;
using plist::Dictionary;
using plist::Value;

namespace {

Dictionary entryOf(const Options& options) {
  Dictionary entry;
  if (options.bucketInterval != 0) entry.set("bucket_interval", options.bucketInterval);
  if (options.significantFigures != 0) entry.set("sig_fig", options.significantFigures);
  if (!options.intervals.empty()) {
    Array bounds;
    for (const double bound : options.intervals) {
      const auto integer = static_cast<std::int64_t>(std::llround(bound));
      if (static_cast<double>(integer) == bound) {
        bounds.emplace_back(integer);
      } else {
        bounds.emplace_back(bound);
      }
    }
    entry.set("intervals", std::move(bounds));
  }
  return entry;
}

void add(Dictionary& group, Section section, std::string_view key, const Options& options) {
  const char* name = kSectionNames[static_cast<std::size_t>(section)];
  Value* entries = group.find(name);
  if (entries == nullptr) entries = &group.set(name, Dictionary());
  entries->as<Dictionary>()->set(key, entryOf(options));
}

}  // namespace

Dictionary whitelist(int scale) {
  Dictionary groups;
  for (std::size_t i = 1; i < std::size(kGroupNames); ++i) {
    Dictionary group;
    const auto addCounters = [&](Section section, const auto& table) {
      for (const auto& row : table) {
        if (row.group != static_cast<Group>(i)) continue;
        for (int copy = 1; copy <= scale; ++copy) {
          add(group, section, scaledKey(row.key, copy), row.options);
        }
      }
    };
    addCounters(Section::scalarKeys, scalarTable());
    addCounters(Section::distributionKeys, distributionTable());
    for (const WhitelistRow& row : whitelistTable()) {
      if (row.group == static_cast<Group>(i)) add(group, row.section, row.key, row.options);
    }
    groups.set(kGroupNames[i], std::move(group));
  }
  return groups;
}

}  // namespace mkdevice
