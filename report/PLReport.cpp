// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "report/PLReport.h"

#include <string>
#include <system_error>
#include <utility>

#include "base/CivilDate.h"
#include "base/Text.h"
#include "platform/PLHistory.h"
#include "platform/SystemLog.h"
#include "plist/PropertyList.h"
#include "report/Collectors.h"

namespace report {

using platform::LogLevel;

namespace {

constexpr int kMaxReadings = 3;

}  // namespace

PLReport::PLReport(const Services& services, morvend::DeviceContext& context)
    : services_(services), context_(context), config_(PLConfig::init(services, context)) {}

base::Result<void> PLReport::writeLogForYesterday(std::int32_t day,
                                                  const ActivatedAppInfo* appInfo) const {
  services_.log.log(LogLevel::info, "writing pellorand log. yesterday=%d", day);
  return sectionsOfDay(day).and_then(
      [&](Sections sections) { return serializeWithDate(day, appInfo, std::move(sections)); });
}

PLReport::Collected PLReport::collect(std::int32_t day) const {
  Collected collected{emptySections()};
  auto& [sections, refused, read] = collected;
  const auto refuse = [&](std::string_view key) {
    if (collected.sections.empty()) collected.refused.emplace(key);
  };
  const auto history = services_.history.initWithDefaultPath();
  const std::int32_t first = base::dayBefore(day);
  read = history->scalarsForKeyPrefix(
      "", first, day, [&](std::string_view key, std::int32_t, std::int64_t value, bool&) {
        if (const auto* options = config_->configOptionsForScalarKey(key)) {
          collected.sections.addScalar(value, key, *options);
        } else {
          refuse(key);
        }
      });
  if (read) {
    read = history->distributionsForKeyPrefix(
        "", first, day, [&](std::string_view key, std::int32_t, auto& samples, bool&) {
          if (const auto* options = config_->configOptionsForDistributionKey(key)) {
            if (samples.comesAgain()) {
              collected.sections.keepPlace(key, *options);
            } else {
              collected.sections.computeAndAddDistribution(samples, key, *options);
            }
          } else {
            refuse(key);
          }
        });
  }
  sections.dropKeptPlaces();
  return collected;
}

// What the history's rows come to, read anew where that may help; when that is nothing, a line says
// why. The error is why it is nothing that should be something.
base::Result<Sections> PLReport::sectionsOfDay(std::int32_t day) const {
  Collected collected{emptySections()};
  for (int reading = 1; config_ != nullptr && reading <= kMaxReadings; ++reading) {
    collected = collect(day);
    const auto& read = collected.read;
    if (read || !read.error().is(std::errc::resource_unavailable_try_again)) break;
  }
  const auto& [sections, refused, read] = collected;
  if (!read) services_.log.log(LogLevel::error, "%s", read.error().text.c_str());
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
  return std::move(collected.sections);
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
