// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The whitelist: which counters go into the daily report, and how each is treated.
//
// Data come from the file "/Library/Application Support/Pelloran/Whitelist_Vrn.plist" and from the
// preferences of "com.norba.da", which switch its key groups. Immutable once built.
#pragma once

#include <memory>
#include <string>
#include <string_view>

#include "device/DeviceContext.h"
#include "platform/SystemLog.h"
#include "report/OptionsTable.h"
#include "report/PrefixTable.h"
#include "report/Services.h"

namespace report {

class PLConfig {
 public:
  // Reads the whitelist; null, with a line in the log, when the file can't be read or parsed.
  // Entries of the wrong type are skipped, each with a line: their keys are not reported.
  static std::unique_ptr<PLConfig> init(const Services& services, morvend::DeviceContext& context);

  // The options that apply to a key: those of the key itself, else of the longest prefix with which
  // it begins, else, on an internal device, kUnnamed. Null when the key is not to be reported. The
  // options are borrowed from this object.
  const CounterOptions* configOptionsForScalarKey(std::string_view key) const;
  const CounterOptions* configOptionsForDistributionKey(std::string_view key) const;

  // Of a key that no entry names: empty. Told from an entry's own options by its address.
  static const CounterOptions kUnnamed;

  // MD5 of the file's bytes, 32 lowercase hexadecimal digits.
  const std::string& configFileDigest() const { return configFileDigest_; }

 private:
  // The entries for scalars, or for distributions.
  struct Table {
    OptionsTable keys;
    PrefixTable prefixes;
  };
  struct Loader;

  PLConfig(platform::SystemLog& log, bool isInternalDevice)
      : log_(log), isInternalDevice_(isInternalDevice) {}

  const CounterOptions* optionsForKey(const Table& table, std::string_view key) const;

  platform::SystemLog& log_;
  Table scalars_, distributions_;
  bool isInternalDevice_;
  std::string configFileDigest_;
};

}  // namespace report
