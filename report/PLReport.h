// The daily counters report: yesterday's whitelisted counters, rounded, with what the report
// collects itself, submitted as one property-list log.
#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <set>
#include <string>
#include <string_view>

#include "device/DeviceContext.h"

#include "platform/PLHistory.h"
#include "report/PLConfig.h"
#include "report/Services.h"

namespace report {

// Activated-app info: one dictionary ("bundle", "version", "orloID", "arch", "uuid") for each
// application, as a client delivered it.
using ActivatedAppInfo = plist::Array;

class PLReport {
 public:
  // Loads the whitelist. Without one nothing is whitelisted and no log will be written.
  PLReport(const Services& services, morvend::DeviceContext& context);

  // Fills the report from the history rows of the day (and of the day before it: a later day's row
  // replaces an earlier one's) and submits it. `day` is the day that is reported; `appInfo` may be
  // null, which is not the same as empty. Failures are logged, and why there is no report when no
  // counter is let through.
  void writeLogForYesterday(std::int32_t day, const ActivatedAppInfo* appInfo);

  // Runs the collectors, builds the log and submits it; does nothing at all when no counter has
  // been added so far. Tells how many keys are in it that no whitelist entry names. Drops the
  // whitelist.
  void serializeWithDate(std::int32_t day, const ActivatedAppInfo* appInfo);

  // Stores a scalar, rounded as its options ask, and returns what it stored.
  std::int64_t addScalar(std::int64_t value, std::string_view key, const CounterOptions& options);

  // The same for a value that is computed only if its key is whitelisted.
  void addScalarForKey(std::string_view key, const std::function<std::int64_t()>& byExecutingBlock);

  // Stores the statistics of the samples, and their histogram if the options hold intervals.
  void computeAndAddDistribution(platform::PLHistoryDistributionEnumerator& samples,
                                 std::string_view key, const CounterOptions& options);

  // The collectors, in the order in which they run; each reads its own source.
  void addInstalledAppInfo();
  void addMetadataKeys();
  void reportDatabaseSize();
  void reportCPUUptime();
  void reportVMStats();

  // What has been added so far. Scalars: int64; distributions: the five statistics; histograms:
  // dictionaries of bucket label to count; metadata: texts.
  const plist::Dictionary& scalarsOutput() const { return scalarsOutput_; }
  const plist::Dictionary& distributionsOutput() const { return distributionsOutput_; }
  const plist::Dictionary& histogramsOutput() const { return histogramsOutput_; }
  const plist::Dictionary& metadataOutput() const { return metadataOutput_; }

 private:
  bool isEmpty() const;
  const CounterOptions* scalarOptions(std::string_view key) const;
  void noteOptions(std::string_view key, const CounterOptions& options);
  plist::Dictionary buildLog(std::int32_t day, const ActivatedAppInfo* appInfo);
  void submit(const std::string& log);

  const Services services_;
  morvend::DeviceContext& context_;
  std::unique_ptr<PLConfig> config_;
  plist::Dictionary scalarsOutput_, distributionsOutput_, histogramsOutput_, metadataOutput_;
  std::set<std::string, std::less<>> unnamed_;  // the keys that no whitelist entry names
};

}  // namespace report
