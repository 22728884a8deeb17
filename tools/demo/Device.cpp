// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/demo/Device.h"

#include <fcntl.h>

#include "host/files/Files.h"
#include "host/files/SystemError.h"
#include "platform/SystemLog.h"
#include "plist/PropertyList.h"

namespace demo {

using base::Error;
using base::Result;
using host::FileDescriptor;
using plist::Dictionary;

namespace {

constexpr std::size_t kMaxFileSize = std::size_t{64} << 20;

Result<std::string> readHostFile(const std::string& path) {
  return host::opened(::open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK))
      .and_then([](const FileDescriptor& file) {
        return host::readRegularFile(file.get(), kMaxFileSize);
      });
}

}  // namespace

Device::Device(std::string root)
    : root_(std::move(root)),
      host_({.root = root_, .lowestLevel = platform::LogLevel::error}),
      whitelist_(report::PLConfig::init(host_.services(), host_.context())) {}

std::vector<std::string> Device::logs() {
  std::vector<std::string> paths;
  for (const std::string& name : namesIn(kSubmitted)) {
    if (!name.starts_with("log-pellorand.193.") || name.ends_with(kOptions)) continue;
    paths.push_back(pathOf(std::string(kSubmitted) + "/" + name));
  }
  return paths;
}

Result<SubmittedLog> Device::readLog(const std::string& path) {
  const auto bytes = readHostFile(path);
  if (!bytes) return bytes.error().at(path);
  auto parsed = plist::read(*bytes);
  if (!parsed) return parsed.error().at(path);
  auto* content = parsed->as<Dictionary>();
  if (content == nullptr) return Error{"not a dictionary"}.at(path);
  SubmittedLog log{path, bytes->size(), std::move(*content), std::nullopt};
  if (const auto beside = readHostFile(path + kOptions)) {
    const auto options = plist::read(*beside);
    const auto* dictionary = options ? options->as<Dictionary>() : nullptr;
    const std::string* version =
        dictionary != nullptr ? dictionary->text("previous_os_version") : nullptr;
    if (version != nullptr) log.previousVersion = *version;
  }
  return log;
}

Recorded Device::recorded(std::int32_t firstDay, std::int32_t lastDay) {
  Recorded recorded;
  const auto history = host_.counters().initWithDefaultPath();
  auto read = history->scalarsForKeyPrefix(
      "", firstDay, lastDay, [&](std::string_view key, std::int32_t, std::int64_t value, bool&) {
        recorded.scalars.insert_or_assign(std::string(key), value);
      });
  if (read) {
    read = history->distributionsForKeyPrefix(
        "", firstDay, lastDay, [&](std::string_view key, std::int32_t, auto&, bool&) {
          recorded.distributions.emplace(key);
        });
  }
  if (!read) host_.services().log.log(platform::LogLevel::error, "%s", read.error().text.c_str());
  return recorded;
}

std::vector<std::string> Device::namesIn(const std::string& folder) {
  return host_.root()
      .openFolder(folder, host::DeviceRoot::Missing::fails)
      .and_then([](const FileDescriptor& opened) { return host::namesInFolder(opened.get()); })
      .orNone()
      .value_or(std::vector<std::string>());
}

std::optional<std::string> Device::bytes(const std::string& path) {
  return host_.root().readFile(path, kMaxFileSize).orNone();
}

std::optional<Dictionary> Device::propertyList(const std::string& path) {
  const auto content = bytes(path);
  if (!content) return std::nullopt;
  auto parsed = plist::read(*content);
  auto* dictionary = parsed ? parsed->as<Dictionary>() : nullptr;
  return dictionary != nullptr ? std::optional(std::move(*dictionary)) : std::nullopt;
}

}  // namespace demo
