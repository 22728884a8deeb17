// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The log-submission service, and the user's consent to it.
#pragma once

#include <functional>
#include <string_view>

#include "plist/Value.h"

namespace platform {

// The consent: true or 1, and nothing else, of this preference.
inline constexpr char kConsentKey[] = "DiagnosticLogSubmissionEnabled";
inline constexpr char kConsentDomain[] = "com.norba.quenset";

// A log that is open for writing.
class LogHandle {
 public:
  virtual ~LogHandle() = default;

  // Appends bytes; false when they couldn't be written, and then the submission fails.
  virtual bool write(std::string_view bytes) = 0;
};

class LogSubmission {
 public:
  using Writer = std::function<void(LogHandle& handle)>;

  virtual ~LogSubmission() = default;

  // Whether the user allows diagnostic logs to be submitted.
  virtual bool DiagnosticLogSubmissionEnabled() = 0;

  // Opens a log, lets the writer write it whole, once more for each further try, and submits it
  // together with its options (null: none). A log is submitted whole or not at all; true on
  // success.
  virtual bool QNSWriteLogForSubmission(std::string_view logType, std::string_view logName,
                                        const plist::Dictionary* options, const Writer& writer) = 0;
};

}  // namespace platform
