// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Structured-data logs as JSON Lines, a file for each day:
// var/spool/morvend/structured/<day>.jsonl.
#pragma once

#include <set>
#include <string>

#include "host/files/DeviceRoot.h"
#include "host/outbox/RandomUUID.h"
#include "platform/Clock.h"
#include "platform/FaultwatchSupport.h"
#include "platform/SystemLog.h"

namespace host {

class StructuredLogFiles : public platform::FaultwatchSupport {
 public:
  // All are borrowed.
  StructuredLogFiles(const DeviceRoot& root, platform::Clock& clock, platform::SystemLog& log)
      : root_(root), clock_(clock), log_(log) {}

  // A log that can't be written is dropped, with an error line for the first of each reason.
  void logStructuredData(std::int32_t type, const plist::Dictionary& data) override;

  // Moves the files of earlier days to the spool of submitted logs, as structured-<day>.jsonl; one
  // above 16 MiB in parts, with a line in the log. What isn't a regular file stays where it is,
  // with an error line.
  void dumpAllOldStructuredDataLogs() override;

  std::string newIncidentIdentifier() override { return randomUUID(); }

 private:
  const DeviceRoot& root_;
  platform::Clock& clock_;
  platform::SystemLog& log_;
  std::set<std::string> said_;  // why logs couldn't be written
};

}  // namespace host
