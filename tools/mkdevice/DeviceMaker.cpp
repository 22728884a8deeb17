#include "tools/mkdevice/DeviceMaker.h"

#include <fcntl.h>
#include <sys/stat.h>

#include <cerrno>
#include <cstring>
#include <filesystem>

#include "daemon/context/DeviceContext.h"
#include "platform/host/Files.h"
#include "platform/host/Host.h"

namespace mkdevice {

namespace fs = std::filesystem;
using platform::host::FileDescriptor;
using platform::host::Host;

namespace {

constexpr char kModulePath[] =
    "System/Library/PrivateFrameworks/FaultwatchSupport.framework/FaultwatchSupport";
constexpr std::size_t kLargestModule = std::size_t{64} << 20;

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
      host.root().openFolder(path.substr(0, slash), platform::host::DeviceRoot::Missing::create);
  if (!folder) return located(path, std::strerror(errno));
  const int error = platform::host::replaceFile(folder.get(), path.substr(slash + 1), bytes);
  return error == 0 ? "" : located(path, platform::host::errorText(error));
}

std::string writeFiles(Host& host, const Sample& sample) {
  for (const SampleFile& file : sampleFiles(sample)) {
    std::string error;
    if (const auto* text = file.content.as<std::string>()) {
      error = writeFile(host, file.path, *text);
    } else {
      const auto xml = host.platform().propertyLists.writeXML(file.content);
      error = xml ? writeFile(host, file.path, *xml) : located(file.path, xml.error.c_str());
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
  const auto bytes = platform::host::readRegularFile(file.get(), kLargestModule);
  return bytes ? writeFile(host, kModulePath, *bytes) : located(module, bytes.error.c_str());
}

std::string recordCounters(Host& host, const Sample& sample, const Listener& listener) {
  const SampleCounters counters(sample);
  for (int done = 0; done < kDaysOfCounters; ++done) {
    listener.progress("day " + std::to_string(done + 1) + " of " + std::to_string(kDaysOfCounters));
    const auto changes = counters.ofDay(sample.today - kDaysOfCounters + done);
    if (std::string error = host.counters().apply(changes); !error.empty()) return error;
    host.counters().PLClientCheckpoint();
  }
  return {};
}

}  // namespace

std::string makeDevice(const MakingOptions& options, const Listener& listener) {
  if (std::string error = makeEmptyFolder(options.folder); !error.empty()) return error;
  Host host({.root = options.folder, .lowestLevel = platform::LogLevel::error});
  morvend::DeviceContext context(host.platform());
  host.keepCountersBelow([&context] { return context.GetHomeDirectoryPath(); });

  listener.progress("writing files");
  if (std::string error = writeFiles(host, options.sample); !error.empty()) return error;
  if (std::string error = copyModule(host, options.module, listener); !error.empty()) return error;
  return recordCounters(host, options.sample, listener);
}

}  // namespace mkdevice
