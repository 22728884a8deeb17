// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "report/PLReport.h"

#include <set>
#include <string>
#include <utility>

#include "base/CivilDate.h"
#include "base/Text.h"
#include "platform/PLHistory.h"
#include "platform/SystemLog.h"
#include "plist/PropertyList.h"
#include "report/Collectors.h"

namespace report {

using platform::LogLevel;

PLReport::PLReport(const Services& services, morvend::DeviceContext& context)
    : services_(services), context_(context), config_(PLConfig::init(services, context)) {}

base::Result<void> PLReport::writeLogForYesterday(std::int32_t day,
                                                  const ActivatedAppInfo* appInfo) const {
  services_.log.log(LogLevel::info, "writing pellorand log. yesterday=%d", day);
  return sectionsOfDay(day).and_then(
      [&](Sections sections) { return serializeWithDate(day, appInfo, std::move(sections)); });
}

// What the history's rows come to; when that is nothing, a line says why. The error is why it is
// nothing that should be something.
base::Result<Sections> PLReport::sectionsOfDay(std::int32_t day) const {
  Sections sections = emptySections();
  std::set<std::string, std::less<>> refused;  // as long as nothing is let through
  const auto refuse = [&](std::string_view key) {
    if (sections.empty()) refused.emplace(key);
  };
  base::Result<void> read;
  if (config_ != nullptr) {
    const auto history = services_.history.initWithDefaultPath();
    const std::int32_t first = base::dayBefore(day);
    read = history->scalarsForKeyPrefix(
        "", first, day, [&](std::string_view key, std::int32_t, std::int64_t value, bool&) {
          if (const auto* options = config_->configOptionsForScalarKey(key)) {
            sections.addScalar(value, key, *options);
          } else {
            refuse(key);
          }
        });
    if (read) {
      read = history->distributionsForKeyPrefix(
          "", first, day, [&](std::string_view key, std::int32_t, auto& samples, bool&) {
            if (const auto* options = config_->configOptionsForDistributionKey(key)) {
              if (samples.comesAgain()) {
                sections.keepPlace(key, *options);
              } else {
                sections.computeAndAddDistribution(samples, key, *options);
              }
            } else {
              refuse(key);
            }
          });
    }
    sections.dropKeptPlaces();
    if (!read) services_.log.log(LogLevel::error, "%s", read.error().text.c_str());
  }
  if (sections.empty()) {
    const std::string why =
        config_ == nullptr ? "the whitelist couldn't be read"
        : !read            ? "the counters can't be read"
        : refused.empty()
            ? "no counter was recorded on that day or the day before"
            : base::format("the whitelist names none of the %zu counters", refused.size());
    services_.log.log(LogLevel::standard, "no report for day %d: %s", day, why.c_str());
    if (!read) return read.error();
  }
  return sections;
}

base::Result<void> PLReport::serializeWithDate(std::int32_t day, const ActivatedAppInfo* appInfo,
                                               Sections sections) const {
  if (sections.empty()) return {};
  addInstalledAppInfo(sections, services_.applications, services_.eventra);
  addMetadataKeys(sections, services_.locale);
  reportDatabaseSize(sections, context_);
  reportCPUUptime(sections, services_.kernel, services_.log);
  reportVMStats(sections, services_.kernel);
  if (sections.unnamedKeys() > 0) {
    services_.log.log(LogLevel::standard,
                      "reporting %zu keys that no whitelist entry names: this is an internal build",
                      sections.unnamedKeys());
  }

  auto header = headerForDay(services_, day,
                             config_ != nullptr ? config_->configFileDigest() : std::string());
  const auto log = plist::writeXML(buildLog(std::move(header), std::move(sections), appInfo));
  if (!log) {
    services_.log.log(LogLevel::error, "Could not create pellorand plist: %s",
                      log.error().text.c_str());
    return log.error();
  }
  if (!submitLog(services_, *log)) return base::Error{"its log couldn't be submitted"};
  return {};
}

}  // namespace report
