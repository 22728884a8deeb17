#include "platform/host/HostKernel.h"

#include <dirent.h>
#include <fcntl.h>
#include <sys/sysinfo.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstring>
#include <ctime>
#include <memory>
#include <vector>

#include "platform/host/Files.h"

namespace platform::host {

namespace {

constexpr char kEventsFolder[] = "device/ecc-events";
constexpr std::size_t kSwapUsageSize = 32;

Kernel::ReadResult failure(int error) { return {error, 0}; }

Kernel::ReadResult deliver(const void* bytes, std::size_t length, std::span<std::byte> buffer) {
  if (length > buffer.size()) return failure(ENOMEM);
  if (length > 0) std::memcpy(buffer.data(), bytes, length);
  return {0, length};
}

Kernel::ReadResult deliverText(const std::string& text, std::span<std::byte> buffer) {
  return deliver(text.c_str(), text.size() + 1, buffer);
}

Kernel::ReadResult deliverInteger(std::uint64_t value, std::span<std::byte> buffer) {
  std::array<std::byte, 8> bytes;
  for (std::size_t i = 0; i < bytes.size(); ++i)
    bytes[i] = static_cast<std::byte>(value >> (8 * i));
  return deliver(bytes.data(), std::min(bytes.size(), buffer.size()), buffer);
}

Kernel::ReadResult deliverValue(const Value& value, std::span<std::byte> buffer) {
  if (const auto* number = value.as<Number>()) return deliverInteger(number->uint64Value(), buffer);
  if (const auto* data = value.as<Data>()) return deliver(data->data(), data->size(), buffer);
  if (const auto* text = value.as<std::string>()) return deliverText(*text, buffer);
  const auto* dictionary = value.as<Dictionary>();
  const Number* error = dictionary != nullptr ? dictionary->number("Error") : nullptr;
  const std::int64_t code = error != nullptr ? error->int64Value() : 0;
  return failure(code > 0 && code <= INT32_MAX ? static_cast<int>(code) : EIO);
}

Kernel::ReadResult bootSession(std::span<std::byte> buffer) {
  const FileDescriptor file(::open("/proc/sys/kernel/random/boot_id", O_RDONLY | O_CLOEXEC));
  std::string text(36, '\0');
  if (!file || ::read(file.get(), text.data(), text.size()) != ssize_t{36}) return failure(ENOENT);
  for (char& c : text) {
    if (c >= 'a' && c <= 'f') c = static_cast<char>(c - 'a' + 'A');
  }
  return deliverText(text, buffer);
}

Kernel::ReadResult swapUsage(std::span<std::byte> buffer) {
  struct sysinfo host;
  if (::sysinfo(&host) != 0) return failure(errno);
  std::array<std::byte, kSwapUsageSize> record{};
  deliverInteger(std::uint64_t{host.totalswap} * host.mem_unit, record);
  // A caller that has no room for the record gets its first field.
  return deliver(record.data(), buffer.size() < record.size() ? 8 : record.size(), buffer);
}

std::vector<std::string> sortedNames(int folder) {
  std::vector<std::string> names;
  const int again = ::openat(folder, ".", O_RDONLY | O_DIRECTORY | O_CLOEXEC);
  DIR* stream = again < 0 ? nullptr : ::fdopendir(again);
  if (stream == nullptr) {
    if (again >= 0) ::close(again);
    return names;
  }
  while (const dirent* entry = ::readdir(stream)) {
    if (entry->d_name[0] != '.') names.emplace_back(entry->d_name);
  }
  ::closedir(stream);
  std::sort(names.begin(), names.end());
  return names;
}

}  // namespace

Kernel::ReadResult HostKernel::sysctlbyname(std::string_view name, std::span<std::byte> buffer) {
  if (name == "kern.next_ecc_event") {
    if (const auto event = nextEvent(buffer)) return *event;
  }
  if (const Value* value = deviceValue(name)) return deliverValue(*value, buffer);
  if (name == "kern.bootsessionuuid") return bootSession(buffer);
  if (name == "vm.swapusage") return swapUsage(buffer);
  return failure(ENOENT);
}

const Value* HostKernel::deviceValue(std::string_view name) {
  const Dictionary* values = values_.dictionary();
  return values != nullptr ? values->find(name) : nullptr;
}

std::optional<Kernel::ReadResult> HostKernel::nextEvent(std::span<std::byte> buffer) {
  const FileDescriptor folder = root_.openFolder(kEventsFolder, DeviceRoot::Missing::fails);
  if (!folder) return std::nullopt;
  for (const std::string& name : sortedNames(folder.get())) {
    const FileDescriptor file(::openat(folder.get(), name.c_str(),
                                       O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC));
    const auto bytes = file ? readRegularFile(file.get(), buffer.size() + 1)
                            : Result<std::string>::failure(std::strerror(errno));
    if (!bytes) {
      log_.log(LogLevel::error, "%s/%s: %s", kEventsFolder, name.c_str(), bytes.error.c_str());
      continue;
    }
    if (bytes->size() > buffer.size()) return failure(ENOMEM);
    // Removed first: an event that stays would be delivered again and again.
    if (::unlinkat(folder.get(), name.c_str(), 0) != 0) {
      const int error = errno;
      log_.log(LogLevel::error, "%s/%s: %s", kEventsFolder, name.c_str(), std::strerror(error));
      return failure(error);
    }
    return deliver(bytes->data(), bytes->size(), buffer);
  }
  return std::nullopt;
}

std::uint64_t HostKernel::pageSize() {
  const Value* given = deviceValue("hw.pagesize");
  const Number* size = given != nullptr ? given->as<Number>() : nullptr;
  return size != nullptr ? size->uint64Value()
                         : static_cast<std::uint64_t>(::sysconf(_SC_PAGESIZE));
}

std::uint64_t HostKernel::absoluteTime() {
  timespec time{};
  ::clock_gettime(CLOCK_MONOTONIC, &time);
  return static_cast<std::uint64_t>(time.tv_sec) * 1'000'000'000 +
         static_cast<std::uint64_t>(time.tv_nsec);
}

std::optional<Kernel::Timebase> HostKernel::timebase() { return Timebase{1, 1}; }

Kernel::Process HostKernel::process() { return {program_invocation_short_name, ::getpid()}; }

}  // namespace platform::host
