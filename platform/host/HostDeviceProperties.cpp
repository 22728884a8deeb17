#include "platform/host/HostDeviceProperties.h"

#include <fcntl.h>
#include <sys/utsname.h>

#include "platform/host/DeviceFileSystem.h"
#include "platform/host/Files.h"

namespace platform::host {

namespace {

constexpr std::uint64_t kNoSuchContainer = 2;

bool isPlainName(std::string_view name) {
  return !name.empty() && name != "." && name != ".." &&
         name.find_first_of(std::string_view("/\0", 2)) == name.npos;
}

// Of a short file of the host; none when it is empty or can't be read.
std::optional<std::string> firstLine(const std::string& path) {
  constexpr std::size_t kLongest = 256;
  const FileDescriptor file(::open(path.c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC));
  const Result<std::string> text = readRegularFile(file.get(), kLongest);
  if (!text) return std::nullopt;
  std::string line = text->substr(0, text->find('\n'));
  return line.empty() ? std::nullopt : std::optional(std::move(line));
}

std::optional<std::string> machineName() {
  utsname host;
  return ::uname(&host) == 0 ? std::optional<std::string>(host.machine) : std::nullopt;
}

// A size in bytes; what is negative is 0.
std::optional<std::uint64_t> bytes(const Dictionary& usage, const char* key) {
  const Number* size = usage.number(key);
  if (size == nullptr) return std::nullopt;
  const bool negative = size->type() != Number::Type::uint64 && size->int64Value() < 0;
  return negative ? 0 : size->uint64Value();
}

}  // namespace

const Number* HostDeviceProperties::number(std::string_view name) {
  const Dictionary* properties = properties_.dictionary();
  return properties != nullptr ? properties->number(name) : nullptr;
}

bool HostDeviceProperties::booleanProperty(std::string_view name) {
  const Number* value = number(name);
  return value != nullptr && value->boolValue();
}

std::optional<std::string> HostDeviceProperties::textProperty(std::string_view name) {
  const Dictionary* properties = properties_.dictionary();
  if (const Value* value = properties != nullptr ? properties->find(name) : nullptr) {
    const auto* text = value->as<std::string>();
    return text != nullptr ? std::optional(*text) : std::nullopt;
  }
  if (name == "SystemIdentifier") return firstLine(machineId_);
  if (name == "HardwareModel") return machineName();
  return std::nullopt;
}

std::optional<std::uint32_t> HostDeviceProperties::multiUserIndicator() {
  const Number* value = number("MultiUser");
  if (value == nullptr) return std::nullopt;
  return static_cast<std::uint32_t>(value->uint64Value());
}

std::optional<DeviceProperties::DiskUsage> HostDeviceProperties::diskUsage() {
  const Dictionary* properties = properties_.dictionary();
  const Value* given = properties != nullptr ? properties->find("DiskUsage") : nullptr;
  if (given == nullptr) {
    const auto host = DeviceFileSystem(root_).statfs("/");
    if (!host) return std::nullopt;
    const std::uint64_t available = host->blocksAvailable * host->blockSize;
    return DiskUsage{host->blocks * host->blockSize, available, available};
  }
  const auto* usage = given->as<Dictionary>();
  if (usage == nullptr) return std::nullopt;
  return DiskUsage{bytes(*usage, "TotalDiskCapacity"), bytes(*usage, "TotalDataAvailable"),
                   bytes(*usage, "AmountDataAvailable")};
}

std::optional<std::string> HostDeviceProperties::systemGroupContainerPath(
    std::string_view identifier, std::uint64_t& error) {
  if (isPlainName(identifier)) {
    std::string path = "/var/containers/systemgroup/" + std::string(identifier);
    if (root_.openFolder(path, DeviceRoot::Missing::fails, DeviceRoot::Links::followed)) {
      return path;
    }
  }
  error = kNoSuchContainer;
  return std::nullopt;
}

}  // namespace platform::host
