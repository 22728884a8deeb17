// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The names under which files of the spool wait for the end of the run that made them:
// ".pending-<day>.<name>" beside <name>, where <day> is the day that the run is for, or "run" for a
// run that no day's record waits for.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace host {

struct PendingName {
  std::optional<std::int32_t> day;
  std::string name;  // that the file is to have
};

// The most that is put before a name.
inline constexpr std::size_t kMaxPendingPrefix = std::string_view(".pending--2147483648.").size();

// What a file's name says; none when it isn't one that waits.
std::optional<PendingName> parsePendingName(std::string_view fileName);

// The run that is on in this process. While none is, nothing waits.
class PendingRun {
 public:
  void begin(std::optional<std::int32_t> day) { *this = PendingRun(day); }
  void end() { *this = PendingRun(); }

  bool isOn() const { return on_; }
  std::optional<std::int32_t> day() const { return day_; }

  // The name that a file has for now.
  std::string nameFor(const std::string& name) const;

  PendingRun() = default;

 private:
  explicit PendingRun(std::optional<std::int32_t> day) : on_(true), day_(day) {}

  bool on_ = false;
  std::optional<std::int32_t> day_;
};

}  // namespace host
