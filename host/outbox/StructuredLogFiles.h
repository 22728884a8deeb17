// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Structured-data logs as JSON Lines, a file for each day:
// var/spool/morvend/structured/<day>.jsonl.
#pragma once

#include <cstdint>
#include <set>
#include <string>
#include <string_view>

#include "base/Result.h"
#include "host/files/DeviceRoot.h"
#include "host/files/Pending.h"
#include "host/outbox/LineFiles.h"
#include "host/outbox/RandomUUID.h"
#include "platform/Clock.h"
#include "platform/FaultwatchSupport.h"
#include "platform/SystemLog.h"

namespace host {

class StructuredLogFiles : public platform::FaultwatchSupport {
 public:
  // What the logs of one day may take. What is beyond is dropped, and counted in one line.
  static constexpr std::uint64_t kMaxDay = std::uint64_t{8} << 20;

  // All are borrowed.
  StructuredLogFiles(const DeviceRoot& root, platform::Clock& clock, platform::SystemLog& log,
                     const PendingRun& run)
      : root_(root), clock_(clock), log_(log), run_(run) {}

  // Says how many logs were dropped.
  ~StructuredLogFiles() override;

  // Waits while a run is on. A log that can't be written is dropped, with an error line for the
  // first of each reason.
  void logStructuredData(std::int32_t type, const plist::Dictionary& data) override;

  // Moves the files of earlier days to the spool of submitted logs, as structured-<day>.jsonl; one
  // above 16 MiB in parts, with a line in the log. What isn't a regular file stays where it is,
  // with an error line.
  void dumpAllOldStructuredDataLogs() override;

  std::string newIncidentIdentifier() override { return randomUUID(); }

  // Brings to disk what waits, so that it can leave after whatever happens.
  base::Result<void> synchronise();

  // Lets what waits leave, or drops it.
  base::Result<void> settle(const Leaves& leaves);

 private:
  base::Result<void> append(const std::string& name, std::string_view line);
  void sayDropped();

  const DeviceRoot& root_;
  platform::Clock& clock_;
  platform::SystemLog& log_;
  const PendingRun& run_;
  std::size_t dropped_ = 0;     // beyond the bytes of a day, since the last line that said so
  std::set<std::string> said_;  // why logs couldn't be written
};

}  // namespace host
