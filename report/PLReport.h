// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The daily counters report: yesterday's whitelisted counters, rounded, with what the report
// collects itself, submitted as one property-list log.
//
// history rows → Sections, with the collectors' values → DailyLog → spool: each a value that the
// next takes. A report itself changes no more once it is made.
#pragma once

#include <cstdint>
#include <memory>

#include "base/Result.h"
#include "device/DeviceContext.h"
#include "report/DailyLog.h"
#include "report/PLConfig.h"
#include "report/Sections.h"
#include "report/Services.h"

namespace report {

class PLReport {
 public:
  // Loads the whitelist. Without one nothing is whitelisted and no log will be written.
  PLReport(const Services& services, morvend::DeviceContext& context);

  // Fills the report from the history rows of the day (and of the day before it: a later day's row
  // replaces an earlier one's) and submits it. `day` is the day that is reported; `appInfo` may be
  // null, which is not the same as empty. Failures are logged, and why there is no report when no
  // counter is let through. The error says why a report that there was to be is lost.
  base::Result<void> writeLogForYesterday(std::int32_t day, const ActivatedAppInfo* appInfo) const;

  // Runs the collectors over what the day's counters came to, builds the log and submits it; does
  // nothing at all when no counter is in the sections. Tells how many keys are in it that no
  // whitelist entry names.
  base::Result<void> serializeWithDate(std::int32_t day, const ActivatedAppInfo* appInfo,
                                       Sections sections) const;

  // Empty sections, into which this report's whitelist lets values.
  Sections emptySections() const { return {config_.get(), services_.log}; }

 private:
  // What the day's rows come to. As long as none is let through, `refused` holds the keys that
  // aren't.
  struct Collected {
    Sections sections;
    std::set<std::string, std::less<>> refused = {};
    base::Result<void> read = {};
  };
  Collected collect(std::int32_t day) const;
  base::Result<Sections> sectionsOfDay(std::int32_t day) const;

  const Services services_;
  morvend::DeviceContext& context_;
  const std::unique_ptr<const PLConfig> config_;
};

}  // namespace report
