// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What a test of a file-backed service needs: a device root of its own, a clock to set, a log to
// ask.
#pragma once

#include <sys/stat.h>

#include <atomic>
#include <string>

#include "host/files/DeviceRoot.h"
#include "platform/Clock.h"
#include "platform/testing/RecordingLog.h"
#include "plist/PropertyList.h"
#include "support/TemporaryFolder.h"

namespace support {

struct SetClock final : platform::Clock {
  std::atomic<double> seconds = 1795320000;  // 2026-11-22T04:00:00Z
  plist::Date now() override { return {seconds}; }
  std::int32_t secondsFromUTC(plist::Date) override { return 0; }
};

struct HostServices {
  TemporaryFolder folder;
  host::DeviceRoot root{folder.path().string()};
  SetClock clock;
  platform::fakes::RecordingLog log;

  std::string xml(const plist::Dictionary& dictionary) { return *plist::writeXML(dictionary); }
};

// What may stand in the place of a file. A link leads to "target", dangling or not; a file may have
// that as its second name.
enum class Kind { link, danglingLink, fifo, folder, secondName };
inline constexpr Kind kOtherKinds[] = {Kind::link, Kind::danglingLink, Kind::fifo, Kind::folder};

inline void put(Kind kind, const std::filesystem::path& at, const std::filesystem::path& target) {
  std::filesystem::create_directories(at.parent_path());
  if (kind == Kind::link || kind == Kind::secondName) std::ofstream(target) << "precious";
  if (kind == Kind::secondName) std::filesystem::create_hard_link(target, at);
  if (kind == Kind::link || kind == Kind::danglingLink) std::filesystem::create_symlink(target, at);
  if (kind == Kind::fifo) ::mkfifo(at.c_str(), 0600);
  if (kind == Kind::folder) std::filesystem::create_directory(at);
}

// Whether what put() left is there still, and nothing was written through it.
inline bool untouched(Kind kind, const std::filesystem::path& at,
                      const std::filesystem::path& target) {
  using std::filesystem::file_type;
  const file_type types[] = {file_type::symlink, file_type::symlink, file_type::fifo,
                             file_type::directory, file_type::regular};
  const bool precious = kind == Kind::link || kind == Kind::secondName;
  std::ifstream file(target);
  const std::string text(std::istreambuf_iterator<char>(file), {});
  return std::filesystem::symlink_status(at).type() == types[static_cast<int>(kind)] &&
         std::filesystem::exists(target) == precious && text == (precious ? "precious" : "") &&
         (kind != Kind::secondName || std::filesystem::equivalent(at, target));
}

}  // namespace support
