// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/RunOutbox.h"

#include <tuple>

#include "platform/Names.h"

namespace host {

using platform::LogLevel;

namespace {

// What a run changes in them is of its day: the record, and the count that its report has taken.
constexpr const char* kHeldDomains[] = {platform::kDaemonName, platform::kPellorandDomain};

}  // namespace

void RunOutbox::settleAll(const Leaves& leaves) {
  const auto settle = [&](auto& part) {
    const auto settled = root_.patience()([&] { return part.settle(leaves); });
    if (settled) return;
    log_.log(LogLevel::error, "Could not let go what waits in %s", settled.error().text.c_str());
  };
  settle(submission_);
  settle(structuredLogs_);
  settle(events_);
  settle(eccEvents_);  // last: what came of its events is to leave before they go
}

void RunOutbox::settle(std::int64_t recordedDay) {
  settleAll(
      [recordedDay](const std::optional<std::int32_t>& day) { return day && *day <= recordedDay; });
}

void RunOutbox::hold(std::optional<std::int32_t> day) {
  events_.drain();  // what was sent before is not this run's
  run_.begin(day);
  eccEvents_.hold(day);
  for (const char* domain : kHeldDomains) preferences_.hold(domain);
}

base::Result<void> RunOutbox::synchronise() {
  return submission_.synchronise()
      .and_then([this] { return structuredLogs_.synchronise(); })
      .and_then([this] { return events_.synchronise(); });
}

void RunOutbox::publish() {
  if (!run_.isOn()) return;
  const auto day = run_.day();
  bool leaves = true;
  events_.drain();
  if (day) {
    if (const auto onDisk = root_.patience()([this] { return synchronise(); }); !onDisk) {
      log_.log(LogLevel::error, "Could not bring to disk what waits in %s",
               onDisk.error().text.c_str());
    }
    leaves = static_cast<bool>(preferences_.release(platform::kDaemonName));
    if (!leaves) {
      log_.log(LogLevel::error,
               "Dropped what the run for day %d left: the day can't be recorded, and will be run "
               "again",
               *day);
      for (const char* domain : kHeldDomains) preferences_.drop(domain);
    } else {
      std::ignore = preferences_.release(platform::kPellorandDomain);
    }
  }
  run_.end();
  settleAll([&](const std::optional<std::int32_t>& of) { return leaves && of == day; });
  if (day) return;
  for (const char* domain : kHeldDomains) std::ignore = preferences_.release(domain);
}

}  // namespace host
