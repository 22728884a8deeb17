// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Log submission into a spool folder: var/spool/morvend/submitted/<log name>.<log type>.<time>,
// with the options beside it (see SpoolFolder). Consent is the user's preference
// "DiagnosticLogSubmissionEnabled": true or 1, and nothing else.
#pragma once

#include <string>

#include "base/Result.h"
#include "host/files/DeviceRoot.h"
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
                  platform::Clock& clock, platform::SystemLog& log)
      : root_(root), preferences_(preferences), clock_(clock), log_(log) {}

  bool DiagnosticLogSubmissionEnabled() override;

  // The spool is locked while the writer writes: it must not submit a log itself. Type and name
  // must be fit for a file's name, and the name not begin with "."; a log larger than the spool
  // fails. What may pass is tried again, with the writer. A failure is logged, with its reason.
  bool QNSWriteLogForSubmission(std::string_view logType, std::string_view logName,
                                const plist::Dictionary* options, const Writer& writer) override;

  // Whether every log could be submitted; the error is the first one's, of its path.
  const base::Result<void>& submitted() const { return submitted_; }

 private:
  base::Result<void> submit(const std::string& stem, const plist::Dictionary* options,
                            const Writer& writer);

  const DeviceRoot& root_;
  platform::PreferenceStore& preferences_;
  platform::Clock& clock_;
  platform::SystemLog& log_;
  base::Result<void> submitted_;
};

}  // namespace host
