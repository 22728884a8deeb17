// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// A small device with something of everything that a daily run reads or writes, and the built
// programs to run on it.
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "faults/FaultRun.h"
#include "plist/Value.h"
#include "support/TemporaryFolder.h"

namespace end_to_end {

using plist::Array;
using plist::Dictionary;
using plist::Value;
using Lines = std::vector<std::string>;

inline constexpr char kDomain[] = "com.norba.pellorand.morvend";
inline constexpr char kWhitelist[] = "Library/Application Support/Pelloran/Whitelist_Vrn.plist";
inline constexpr char kSubmitted[] = "var/spool/morvend/submitted";
inline constexpr char kModule[] =
    "System/Library/PrivateFrameworks/FaultwatchSupport.framework/FaultwatchSupport";

class Device {
 public:
  // An empty device root.
  Device();

  // Counters of three days, whitelist, consent, tasking for three users, device files, logs to be
  // rolled and dumped, the module, an ECC event, a reporting channel, a process that used the
  // network, a worn storage controller with every list. It is a day on which storage counters go to
  // the counters service.
  void fill();

  const support::TemporaryFolder& root() const { return *root_; }
  std::int32_t today() const { return today_; }

  // Runs a built program on this root; `bus` is the address of a message bus, by default none.
  faults::Outcome run(const std::string& program, faults::Strings arguments,
                      const faults::Fault& fault = {}, const std::string& bus = "") const;

  // The same, only counting the calls at which a fault of a kind can be made.
  std::size_t countCalls(const std::string& program, faults::Strings arguments,
                         const std::string& kind) const;

  // What tells a program of this root and that bus.
  faults::Strings environment(const std::string& bus) const;

  // Copies the other device's root over this one.
  void become(const Device& other);

  void writePropertyList(const std::string& path, const Value& value) const;
  std::optional<Value> readPropertyList(const std::string& path) const;

  // One of user mobile's preferences in the daemon's domain.
  std::optional<Value> record(const std::string& key) const;

  // The names in a folder, sorted; empty when there is no such folder.
  Lines names(const std::string& folder) const;

  // The daily logs in the spool, parsed; one that doesn't parse is an empty dictionary.
  std::vector<Dictionary> dailyLogs() const;

  // The storage logs in the spool.
  Lines storageLogs() const;

  // The lines of structured data in the spool, then of those that aren't dumped yet.
  Lines structuredLogs() const;

  // The log that this device's counters make for yesterday, without what a run adds to it: the
  // creation date and the collectors' values.
  Dictionary expectedSections() const;

  // Every row of the history before today as one text a row.
  Lines history() const { return rows(INT32_MIN, today_ - 1); }

  // Whether the counters database is all right for SQLite itself.
  bool databaseIsSound() const;

  // Today's rows: what the runs have recorded.
  Lines recorded() const { return rows(today_, INT32_MAX); }

 private:
  Lines rows(std::int32_t first, std::int32_t last) const;

  std::unique_ptr<support::TemporaryFolder> root_;
  std::int32_t today_;
};

// The lines of a program's standard error, without their priority prefix.
Lines linesOf(const std::string& standardError);

// The last of them, with its prefix.
std::string lastLine(const faults::Outcome& outcome);

// Whether morvend came to its end; only what is written at the end of the process may follow.
bool ended(const faults::Outcome& outcome);

}  // namespace end_to_end
