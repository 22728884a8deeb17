// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The fakes, and shorthands for what tests set up again and again.
#pragma once

#include <initializer_list>
#include <string>

#include "platform/SystemLog.h"
#include "platform/testing/FakePlatform.h"
#include "plist/PropertyList.h"

namespace support {

// Whether a line of the log is the storage library's, or about it: every daily run has some.
inline bool isAboutStorage(const std::string& line) {
  return line.find("NANDInfo: ") != line.npos || line.find(" nand info") != line.npos;
}

class TestPlatform : public platform::fakes::FakePlatform {
 public:
  explicit TestPlatform(platform::LogLevel lowest = platform::LogLevel::debug)
      : FakePlatform(lowest) {}

  static constexpr char kWhitelist[] = "/Library/Application Support/Pelloran/Whitelist_Vrn.plist";

  void setWhitelist(const plist::Dictionary& groups) {
    files.contents[kWhitelist] = *plist::writeXML(plist::Value(groups));
  }

  // A whitelist of one group whose scalar keys are all unrounded.
  void whitelistScalars(std::initializer_list<const char*> keys) {
    plist::Dictionary entries;
    for (const char* key : keys) entries.set(key, plist::Dictionary());
    setWhitelist({{"Group", plist::Dictionary{{"ScalarKeys", entries}}}});
  }

  plist::Dictionary parse(const std::string& bytes) {
    const auto value = plist::read(bytes);
    const auto* dictionary = value ? value->as<plist::Dictionary>() : nullptr;
    return dictionary != nullptr ? *dictionary : plist::Dictionary();
  }
};

}  // namespace support
