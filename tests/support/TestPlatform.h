// The fakes with the real codec and digest, and shorthands for what tests set up again and again.
#pragma once

#include <string>

#include "platform/host/HostPropertyListCodec.h"
#include "platform/host/MD5Digest.h"
#include "platform/testing/FakePlatform.h"

namespace support {

struct RealCodecs {
  platform::host::HostPropertyListCodec codec;
  platform::host::MD5Digest digest;
};

// Whether a line of the log is the storage library's, or about it: every daily run has some.
inline bool isAboutStorage(const std::string& line) {
  return line.find("NANDInfo: ") != line.npos || line.find(" nand info") != line.npos;
}

class TestPlatform : private RealCodecs, public platform::fakes::FakePlatform {
 public:
  explicit TestPlatform(platform::LogLevel lowest = platform::LogLevel::debug)
      : FakePlatform(codec, digest, lowest) {}

  static constexpr char kWhitelist[] = "/Library/Application Support/Pelloran/Whitelist_Vrn.plist";

  void setWhitelist(const platform::Dictionary& groups) {
    files.contents[kWhitelist] = *codec.writeXML(platform::Value(groups));
  }

  // A whitelist of one group whose scalar keys are all unrounded.
  void whitelistScalars(std::initializer_list<const char*> keys) {
    platform::Dictionary entries;
    for (const char* key : keys) entries.set(key, platform::Dictionary());
    setWhitelist({{"Group", platform::Dictionary{{"ScalarKeys", entries}}}});
  }

  platform::Dictionary parse(const std::string& bytes) {
    const auto value = codec.read(bytes);
    const auto* dictionary = value ? value->as<platform::Dictionary>() : nullptr;
    return dictionary != nullptr ? *dictionary : platform::Dictionary();
  }
};

}  // namespace support
