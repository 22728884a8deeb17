// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/mkdevice/DeviceMaker.h"

#include <fcntl.h>
#include <sys/stat.h>

#include <array>
#include <filesystem>
#include <system_error>

#include "base/CivilDate.h"
#include "base/Text.h"
#include "daemon/DailyRun.h"
#include "host/Host.h"
#include "host/files/Files.h"
#include "host/files/SystemError.h"
#include "host/outbox/RandomUUID.h"
#include "plist/PropertyList.h"
#include "tools/mkdevice/Random.h"
#include "tools/mkdevice/SampleCounters.h"
#include "tools/mkdevice/SampleDay.h"
#include "tools/mkdevice/SampleFiles.h"
#include "tools/mkdevice/Wear.h"

namespace mkdevice {

namespace fs = std::filesystem;
using base::Error;
using base::Result;
using host::FileDescriptor;
using host::Host;

namespace {

constexpr char kModulePath[] =
    "System/Library/PrivateFrameworks/FaultwatchSupport.framework/FaultwatchSupport";
constexpr std::size_t kMaxModuleSize = std::size_t{64} << 20;

// With the folder that makes it a recorded device.
Result<void> makeEmptyRoot(const fs::path& folder) {
  std::error_code error;
  if (folder.has_parent_path()) fs::create_directories(folder.parent_path(), error);
  if (error) return Error{error.message()}.at(folder.parent_path().string());
  const auto made = host::checked(::mkdir(folder.c_str(), 0700));
  if (!made) {
    if (!made.error().is(std::errc::file_exists)) return made.error().at(folder.string());
    if (!fs::is_directory(folder, error)) {
      return Error{"it exists and is not a folder"}.at(folder.string());
    }
    const bool empty = fs::is_empty(folder, error);
    if (error) return Error{error.message()}.at(folder.string());
    if (!empty) return Error{"the folder is not empty"}.at(folder.string());
  }
  const fs::path device = folder / "device";
  return host::checked(::mkdir(device.c_str(), 0700)).at(device.string());
}

// `path` is a path of the device.
Result<void> writeFile(const Host& host, const std::string& path, std::string_view bytes) {
  const auto slash = path.rfind('/');
  return host.root()
      .openFolder(path.substr(0, slash), host::DeviceRoot::Missing::create)
      .and_then([&](const FileDescriptor& folder) {
        return host::replaceFile(folder.get(), path.substr(slash + 1), bytes);
      })
      .at((fs::path(host.root().path()) / path).string());
}

Result<void> writeFiles(Host& host, const std::vector<SampleFile>& files) {
  for (const SampleFile& file : files) {
    const auto* text = file.content.as<std::string>();
    const auto bytes = text != nullptr ? *text : plist::writeXML(file.content).at(file.path);
    if (!bytes) return bytes.error();
    if (auto written = writeFile(host, file.path, *bytes); !written) return written;
  }
  return {};
}

Result<void> copyModule(const Host& host, const std::string& module, const Listener& listener) {
  const auto file = host::opened(::open(module.c_str(), O_RDONLY | O_CLOEXEC));
  if (!file) {
    listener.warning(file.error().at(module).text +
                     "; the device will lack its crash-reporting support library");
    return {};
  }
  const auto bytes = host::readRegularFile(file->get(), kMaxModuleSize);
  return bytes ? writeFile(host, kModulePath, *bytes) : bytes.error().at(module);
}

Result<void> makeRoot(const MakingOptions& options, const Sample& first,
                      const SampleCounters& counters, const Listener& listener) {
  Host host({.root = options.folder, .lowestLevel = platform::LogLevel::error, .log = options.log});
  listener.progress("writing files");
  auto made = writeFiles(host, lastingFiles(first))
                  .and_then([&] { return writeFiles(host, filesOfDay(first)); })
                  .and_then([&] { return copyModule(host, options.module, listener); });
  for (int done = 0; made && done < kDaysOfCounters; ++done) {
    listener.progress(base::format("counters of day %d of %d", done + 1, kDaysOfCounters));
    made = host.counters().apply(counters.ofDay(first.today - kDaysOfCounters + done));
    host.counters().PLClientCheckpoint();
  }
  return made ? host.counters().settle() : made;
}

// The run of the day that begins with `sample.today`, by the timer some minutes past midnight.
host::PlayedRun dailyRun(const Sample& sample) {
  constexpr std::uint64_t kTicksPerSecond = 1'000'000'000;
  Random random(sample.seed, "daily run", sample.today);
  const std::int64_t second = random.between(600, 2400);
  const auto sinceBoot =
      Wear(sample, 0).hoursSinceBoot() * 3600 + static_cast<std::uint64_t>(second);
  std::array<std::uint32_t, 4> words;
  for (std::uint32_t& word : words) word = static_cast<std::uint32_t>(random.next());
  return {.now = {static_cast<double>(sample.today * base::kSecondsPerDay + second)},
          .sinceBoot = sinceBoot * kTicksPerSecond,
          .process = {"morvend", static_cast<std::int32_t>(random.between(300, 30000))},
          .incident = host::UUIDFrom(words)};
}

// The day that begins with `sample.today`, and what is new when the next one begins.
Result<void> playDay(const MakingOptions& options, Sample sample, const SampleCounters& counters) {
  Host host({.root = options.folder,
             .lowestLevel = platform::LogLevel::error,
             .played = dailyRun(sample),
             .log = options.log});
  morvend::RunDailyTasksIfDue(host.services(), host.context(), nullptr);
  auto recorded = host.counters().apply(counters.ofDay(sample.today)).and_then([&] {
    return host.counters().settle();
  });
  if (!recorded) return recorded;
  ++sample.today;
  return writeFiles(host, filesOfDay(sample));
}

}  // namespace

Result<void> makeDevice(const MakingOptions& options, const Listener& listener) {
  if (auto folder = makeEmptyRoot(options.folder); !folder) return folder;
  const SampleCounters counters(options.sample);
  Sample sample = options.sample;
  sample.today -= options.days;
  auto made = makeRoot(options, sample, counters, listener);
  for (; made && sample.today < options.sample.today; ++sample.today) {
    const int played = options.days - (options.sample.today - sample.today);
    listener.progress(base::format("playing day %d of %d", played + 1, options.days));
    made = playDay(options, sample, counters);
  }
  return made;
}

}  // namespace mkdevice
