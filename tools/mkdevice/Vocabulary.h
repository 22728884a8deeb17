// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The vocabulary of a sample device: the counters that it keeps, and what its whitelist says of
// them. The tables stand in files of their own, which hold nothing but rows.
#pragma once

#include <cstdint>
#include <span>

namespace mkdevice {

// The key groups of the whitelist, in its order. A counter in `none` has no entry of its own:
// a prefix may let it through, otherwise it must not leave the device.
enum class Group {
  none,
  battery,
  display,
  radio,
  storage,
  system,
  machine,          // the figures that `pelloran sample` records
  experiments,      // switched off by a preference
  internalTesting,  // for internal devices alone
};
inline constexpr const char* kGroupNames[] = {nullptr,   "Battery",     "Display",
                                              "Radio",   "Storage",     "System",
                                              "Machine", "Experiments", "InternalTesting"};

enum class Section { scalarKeys, distributionKeys, scalarPrefixes, distributionPrefixes };
inline constexpr const char* kSectionNames[] = {"ScalarKeys", "DistributionKeys",
                                                "ScalarKeyPrefixes", "DistributionKeyPrefixes"};

// The options of an entry of the whitelist; what is 0 or empty is left out.
struct Options {
  std::uint64_t bucketInterval = 0;
  std::uint64_t significantFigures = 0;
  std::span<const double> intervals = {};
};

// How a counter varies from day to day.
enum class Daily {
  constant,  // not at all
  steady,    // a fifth up or down
  workdays,  // high from Monday to Friday
  weekends,  // high on Saturday and Sunday
  growing,   // never falls
  rare,      // 0 on most days
};

// How the samples of a day spread around the day's level.
enum class Shape {
  even,      // all of the range alike
  bell,      // most of them near the middle
  longTail,  // a few many times the others
};

struct ScalarRow {
  const char* key;
  Group group;
  Options options;
  std::int64_t typical;  // the value on a usual day
  Daily daily;
};

struct DistributionRow {
  const char* key;
  Group group;
  Options options;
  double typical;  // the middle of a usual day's samples
  double spread;   // how far they lie from it, as a part of it
  Shape shape;
  int samples;  // on a usual day
  Daily daily;  // of the level
};

// An entry of the whitelist for something else than a counter of these tables: a prefix, a value
// that the report collects itself, a figure of this machine, or a second entry for a key.
struct WhitelistRow {
  Group group;
  Section section;
  const char* key;
  Options options;
};

std::span<const ScalarRow> scalarTable();
std::span<const DistributionRow> distributionTable();
std::span<const WhitelistRow> whitelistTable();

}  // namespace mkdevice
