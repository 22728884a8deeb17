// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/files/Pending.h"

#include <charconv>
#include <system_error>

namespace host {

namespace {

constexpr std::string_view kPrefix = ".pending-";
constexpr std::string_view kNoDay = "run";

}  // namespace

std::optional<PendingName> parsePendingName(std::string_view fileName) {
  if (!fileName.starts_with(kPrefix)) return std::nullopt;
  fileName.remove_prefix(kPrefix.size());
  const auto dot = fileName.find('.');
  if (dot == fileName.npos || dot + 1 == fileName.size()) return std::nullopt;
  PendingName pending{.day = {}, .name = std::string(fileName.substr(dot + 1))};
  const std::string_view run = fileName.substr(0, dot);
  if (run == kNoDay) return pending;
  const char* const end = run.data() + run.size();
  const auto parsed = std::from_chars(run.data(), end, pending.day.emplace());
  if (parsed.ec != std::errc{} || parsed.ptr != end) return std::nullopt;
  return pending;
}

std::string PendingRun::nameFor(const std::string& name) const {
  if (!on_) return name;
  return std::string(kPrefix) + (day_ ? std::to_string(*day_) : std::string(kNoDay)) + "." + name;
}

}  // namespace host
