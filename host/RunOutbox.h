// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Keeps back what a run leaves: logs in the spool, structured logs, events, the files of the memory
// errors that it has read, the process's own preferences, and that the report has taken the count
// of damaged databases.
//
// Everything is on disk, under names that nobody looks for, before the preferences are written with
// the record of the day in them; that one renaming decides. A run that ends before it has left
// nothing, one that ends after it has left everything: what still waits gets its name by the next
// run, once; only a count that was taken may be told again if the run ends just then.
#pragma once

#include <cstdint>
#include <optional>

#include "base/Result.h"
#include "host/files/DeviceRoot.h"
#include "host/files/Pending.h"
#include "host/outbox/EventSink.h"
#include "host/outbox/StructuredLogFiles.h"
#include "host/outbox/SubmissionSpool.h"
#include "host/preferences/PreferenceFiles.h"
#include "host/recorded/EccEventFiles.h"
#include "platform/Outbox.h"
#include "platform/SystemLog.h"

namespace host {

class RunOutbox final : public platform::Outbox {
 public:
  // All are borrowed; the run is the one that the others were made with.
  RunOutbox(const DeviceRoot& root, PendingRun& run, SubmissionSpool& submission,
            StructuredLogFiles& structuredLogs, EventSink& events,
            recorded::EccEventFiles& eccEvents, PreferenceFiles& preferences,
            platform::SystemLog& log)
      : root_(root),
        run_(run),
        submission_(submission),
        structuredLogs_(structuredLogs),
        events_(events),
        eccEvents_(eccEvents),
        preferences_(preferences),
        log_(log) {}

  void settle(std::int64_t recordedDay) override;
  void hold(std::optional<std::int32_t> day) override;
  void publish() override;

 private:
  base::Result<void> synchronise();
  void settleAll(const Leaves& leaves);

  const DeviceRoot& root_;
  PendingRun& run_;
  SubmissionSpool& submission_;
  StructuredLogFiles& structuredLogs_;
  EventSink& events_;
  recorded::EccEventFiles& eccEvents_;
  PreferenceFiles& preferences_;
  platform::SystemLog& log_;
};

}  // namespace host
