// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// A device root that a daily run has gone over, opened to be shown.
#pragma once

#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <optional>
#include <set>
#include <string>
#include <vector>

#include "NANDInfo/Services.h"
#include "base/Result.h"
#include "host/Host.h"
#include "platform/CountersService.h"
#include "report/PLConfig.h"

namespace demo {

// A submitted report as it was written.
struct SubmittedLog {
  std::string path;  // of the host
  std::size_t size;
  plist::Dictionary content;
  std::optional<std::string> previousVersion;  // from the options that were submitted with it
};

// What was recorded on some days, the latest value of each key.
struct Recorded {
  std::map<std::string, std::int64_t, std::less<>> scalars;
  std::set<std::string, std::less<>> distributions;
};

class Device {
 public:
  static constexpr char kSubmitted[] = "var/spool/morvend/submitted";
  static constexpr char kOptions[] = ".options.plist";

  explicit Device(std::string root);

  // The submitted reports, the oldest first: paths of the host.
  std::vector<std::string> logs();

  base::Result<SubmittedLog> readLog(const std::string& path);
  Recorded recorded(std::int32_t firstDay, std::int32_t lastDay);

  // Null, with a line on standard error, when it can't be read.
  const report::PLConfig* whitelist() const { return whitelist_.get(); }

  // The names in a folder of the device, in bytewise order; a missing folder has none.
  std::vector<std::string> namesIn(const std::string& folder);

  // A file of the device: its bytes, or the property list that it is. None if there is none.
  std::optional<std::string> bytes(const std::string& path);
  std::optional<plist::Dictionary> propertyList(const std::string& path);

  NANDInfo::Services services() const { return host_.services(); }

  std::int32_t today() const { return host_.services().counters.PLDaysSince1970(); }

  // The host's path of a path of the device.
  std::string pathOf(const std::string& path) const { return root_ + "/" + path; }

 private:
  std::string root_;
  host::Host host_;
  std::unique_ptr<report::PLConfig> whitelist_;
};

}  // namespace demo
