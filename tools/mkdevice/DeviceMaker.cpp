#include "tools/mkdevice/DeviceMaker.h"

#include <fcntl.h>
#include <sys/stat.h>

#include <array>
#include <cerrno>
#include <cstring>
#include <filesystem>
#include <memory>
#include <optional>

#include "base/CivilDate.h"
#include "base/Text.h"
#include "daemon/DailyRun.h"
#include "host/Host.h"
#include "host/files/Files.h"
#include "host/outbox/RandomUUID.h"
#include "plist/PropertyList.h"
#include "tools/mkdevice/Random.h"
#include "tools/mkdevice/SampleCounters.h"
#include "tools/mkdevice/SampleDay.h"
#include "tools/mkdevice/SampleFiles.h"
#include "tools/mkdevice/Wear.h"

namespace mkdevice {

namespace fs = std::filesystem;
using host::FileDescriptor;
using host::Host;

namespace {

constexpr char kModulePath[] =
    "System/Library/PrivateFrameworks/FaultwatchSupport.framework/FaultwatchSupport";
constexpr std::size_t kMaxModuleSize = std::size_t{64} << 20;

std::string located(const fs::path& place, const char* what) {
  return place.string() + ": " + what;
}

std::string makeEmptyFolder(const fs::path& folder) {
  std::error_code error;
  if (folder.has_parent_path()) fs::create_directories(folder.parent_path(), error);
  if (error) return located(folder.parent_path(), error.message().c_str());
  if (::mkdir(folder.c_str(), 0700) == 0) return {};
  if (errno != EEXIST) return located(folder, std::strerror(errno));
  if (!fs::is_directory(folder, error)) return located(folder, "it exists and is not a folder");
  const bool empty = fs::is_empty(folder, error);
  if (error) return located(folder, error.message().c_str());
  return empty ? "" : located(folder, "the folder is not empty");
}

// `path` is a path of the device.
std::string writeFile(const Host& host, const std::string& path, std::string_view bytes) {
  const auto slash = path.rfind('/');
  const FileDescriptor folder =
      host.root().openFolder(path.substr(0, slash), host::DeviceRoot::Missing::create);
  const int error = folder ? host::replaceFile(folder.get(), path.substr(slash + 1), bytes) : errno;
  if (error == 0) return {};
  return located(fs::path(host.root().path()) / path, host::errorText(error));
}

std::string writeFiles(Host& host, const std::vector<SampleFile>& files) {
  for (const SampleFile& file : files) {
    std::string error;
    if (const auto* text = file.content.as<std::string>()) {
      error = writeFile(host, file.path, *text);
    } else {
      const auto xml = plist::writeXML(file.content);
      error = xml ? writeFile(host, file.path, *xml) : located(file.path, xml.error().text.c_str());
    }
    if (!error.empty()) return error;
  }
  return {};
}

std::string copyModule(const Host& host, const std::string& module, const Listener& listener) {
  const FileDescriptor file(::open(module.c_str(), O_RDONLY | O_CLOEXEC));
  if (!file) {
    listener.warning(located(module, std::strerror(errno)) +
                     "; the device will lack its crash-reporting support library");
    return {};
  }
  const auto bytes = host::readRegularFile(file.get(), kMaxModuleSize);
  return bytes ? writeFile(host, kModulePath, *bytes) : located(module, bytes.error().text.c_str());
}

std::string makeRoot(const MakingOptions& options, const Sample& first,
                     const SampleCounters& counters, const Listener& listener) {
  Host host({.root = options.folder, .lowestLevel = platform::LogLevel::error, .log = options.log});
  listener.progress("writing files");
  std::string error = writeFiles(host, lastingFiles(first));
  if (error.empty()) error = writeFiles(host, filesOfDay(first));
  if (error.empty()) error = copyModule(host, options.module, listener);
  for (int done = 0; error.empty() && done < kDaysOfCounters; ++done) {
    listener.progress(base::format("counters of day %d of %d", done + 1, kDaysOfCounters));
    error = host.counters().apply(counters.ofDay(first.today - kDaysOfCounters + done));
    host.counters().PLClientCheckpoint();
  }
  return error.empty() ? host.counters().settle() : error;
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
std::string playDay(const MakingOptions& options, Sample sample, const SampleCounters& counters) {
  Host host({.root = options.folder,
             .lowestLevel = platform::LogLevel::error,
             .played = dailyRun(sample),
             .log = options.log});
  morvend::RunDailyTasksIfDue(host.services(), host.context(), nullptr);
  std::string error = host.counters().apply(counters.ofDay(sample.today));
  if (error.empty()) error = host.counters().settle();
  if (!error.empty()) return error;
  ++sample.today;
  return writeFiles(host, filesOfDay(sample));
}

}  // namespace

std::string makeDevice(const MakingOptions& options, const Listener& listener) {
  if (std::string error = makeEmptyFolder(options.folder); !error.empty()) return error;
  const SampleCounters counters(options.sample);
  Sample sample = options.sample;
  sample.today -= options.days;
  std::string error = makeRoot(options, sample, counters, listener);
  for (; error.empty() && sample.today < options.sample.today; ++sample.today) {
    const int played = options.days - (options.sample.today - sample.today);
    listener.progress(base::format("playing day %d of %d", played + 1, options.days));
    error = playDay(options, sample, counters);
  }
  return error;
}

}  // namespace mkdevice
