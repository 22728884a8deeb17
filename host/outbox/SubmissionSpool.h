// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Log submission into a spool folder: var/spool/morvend/submitted/<log name>.<log type>.<time>,
// with the options beside it (see SpoolFolder). Consent is the user's preference
// "DiagnosticLogSubmissionEnabled": true or 1, and nothing else.
#pragma once

#include <string>

#include "base/Result.h"
#include "host/files/DeviceRoot.h"
#include "host/files/Pending.h"
#include "host/outbox/LineFiles.h"
#include "platform/Clock.h"
#include "platform/LogSubmission.h"
#include "platform/PreferenceStore.h"
#include "platform/SystemLog.h"
#include "plist/PropertyList.h"

namespace host {

class SubmissionSpool final : public platform::LogSubmission {
 public:
  // All are borrowed.
  SubmissionSpool(const DeviceRoot& root, platform::PreferenceStore& preferences,
                  platform::Clock& clock, platform::SystemLog& log, const PendingRun& run)
      : root_(root), preferences_(preferences), clock_(clock), log_(log), run_(run) {}

  bool DiagnosticLogSubmissionEnabled() override;

  // The spool is locked while the writer writes: it must not submit a log itself. Type and name
  // must be fit for a file's name, and the name not begin with "."; a log larger than the spool
  // fails. While a run is on, the log waits. Where the disk has no room for it, the spool's oldest
  // logs go; what may pass is tried again; either way the writer is called again. A failure is
  // logged, with its reason.
  bool QNSWriteLogForSubmission(std::string_view logType, std::string_view logName,
                                const plist::Dictionary* options, const Writer& writer) override;

  // Brings to disk that logs wait.
  base::Result<void> synchronise();

  // Lets the logs that wait leave, or drops them.
  base::Result<void> settle(const Leaves& leaves);

  // Whether every log could be submitted; the error is the first one's, of its path.
  const base::Result<void>& submitted() const { return submitted_; }

 private:
  bool removeOldest();
  base::Result<void> submit(const std::string& stem, const plist::Dictionary* options,
                            const Writer& writer);

  const DeviceRoot& root_;
  platform::PreferenceStore& preferences_;
  platform::Clock& clock_;
  platform::SystemLog& log_;
  const PendingRun& run_;
  base::Result<void> submitted_;
};

}  // namespace host
