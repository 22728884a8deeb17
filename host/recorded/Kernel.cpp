// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/recorded/Kernel.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <sys/sysinfo.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdint>
#include <cstring>
#include <ctime>
#include <optional>
#include <system_error>

#include "base/ByteWriter.h"
#include "host/files/Files.h"
#include "host/files/SystemError.h"

namespace host::recorded {

namespace {

constexpr char kEventsFolder[] = "device/ecc-events";
constexpr char kRejected[] = "rejected";
constexpr std::size_t kMaxEventSize = 72;
constexpr std::size_t kSwapUsageSize = 32;

platform::Kernel::ReadResult failure(int error) { return {error, 0}; }

platform::Kernel::ReadResult deliver(const void* bytes, std::size_t length,
                                     std::span<std::byte> buffer) {
  if (length > buffer.size()) return failure(ENOMEM);
  if (length > 0) std::memcpy(buffer.data(), bytes, length);
  return {0, length};
}

platform::Kernel::ReadResult deliverText(const std::string& text, std::span<std::byte> buffer) {
  return deliver(text.c_str(), text.size() + 1, buffer);
}

platform::Kernel::ReadResult deliverInteger(std::uint64_t value, std::span<std::byte> buffer) {
  const auto bytes = base::littleEndianBytes(value);
  return deliver(bytes.data(), std::min(bytes.size(), buffer.size()), buffer);
}

platform::Kernel::ReadResult deliverValue(const plist::Value& value, std::span<std::byte> buffer) {
  if (const auto* number = value.as<plist::Number>())
    return deliverInteger(number->uint64Value(), buffer);
  if (const auto* data = value.as<plist::Data>())
    return deliver(data->data(), data->size(), buffer);
  if (const auto* text = value.as<std::string>()) return deliverText(*text, buffer);
  const auto* dictionary = value.as<plist::Dictionary>();
  const plist::Number* error = dictionary != nullptr ? dictionary->number("Error") : nullptr;
  const std::int64_t code = error != nullptr ? error->int64Value() : 0;
  return failure(code > 0 && code <= INT32_MAX ? static_cast<int>(code) : EIO);
}

platform::Kernel::ReadResult bootSession(std::span<std::byte> buffer) {
  const FileDescriptor file(::open("/proc/sys/kernel/random/boot_id", O_RDONLY | O_CLOEXEC));
  std::string text(36, '\0');
  if (!file || ::read(file.get(), text.data(), text.size()) != ssize_t{36}) return failure(ENOENT);
  for (char& c : text) {
    if (c >= 'a' && c <= 'f') c = static_cast<char>(c - 'a' + 'A');
  }
  return deliverText(text, buffer);
}

platform::Kernel::ReadResult swapUsage(std::span<std::byte> buffer) {
  struct sysinfo host;
  if (::sysinfo(&host) != 0) return failure(errno);
  std::array<std::byte, kSwapUsageSize> record{};
  deliverInteger(std::uint64_t{host.totalswap} * host.mem_unit, record);
  // A caller that has no room for the record gets its first field.
  return deliver(record.data(), buffer.size() < record.size() ? 8 : record.size(), buffer);
}

// Renames a file of the folder to the first of the names <to>, <to>-2, and so on that is free.
base::Result<void> renameNumbered(int folder, const std::string& from, int toFolder,
                                  const std::string& to) {
  for (int number = 1;; ++number) {
    const std::string name = number == 1 ? to : to + "-" + std::to_string(number);
    auto renamed = renameToFreeName(folder, from, toFolder, name);
    if (renamed || !renamed.error().is(std::errc::file_exists)) return renamed;
  }
}

// Moves a file of the folder to its rejected ones, under a name that is free.
base::Result<void> reject(int folder, const std::string& name) {
  auto made = makeFolder(folder, kRejected);
  if (!made && !made.error().is(std::errc::file_exists)) return made;
  const auto rejected =
      opened(::openat(folder, kRejected, O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
  if (!rejected) return rejected.error();
  return renameNumbered(folder, name, rejected->get(), name);
}

}  // namespace

platform::Kernel::ReadResult Kernel::sysctlbyname(std::string_view name,
                                                  std::span<std::byte> buffer) {
  if (name == "kern.next_ecc_event") {
    if (const auto event = nextEvent(buffer)) return *event;
  }
  if (const plist::Value* value = deviceValue(name)) return deliverValue(*value, buffer);
  if (root_.isRecorded()) return failure(ENOENT);
  if (name == "kern.bootsessionuuid") return bootSession(buffer);
  if (name == "vm.swapusage") return swapUsage(buffer);
  return failure(ENOENT);
}

const plist::Value* Kernel::deviceValue(std::string_view name) {
  const plist::Dictionary* values = values_.dictionary();
  return values != nullptr ? values->find(name) : nullptr;
}

std::optional<platform::Kernel::ReadResult> Kernel::nextEvent(std::span<std::byte> buffer) {
  // Events are taken away, so the folder is one that is written to.
  const auto folder = root_.openFolder(kEventsFolder, DeviceRoot::Missing::fails);
  // The events are asked for until there is none: what is in the way is said once.
  const auto say = [this](const std::string& name, const std::string& what) {
    if (!saidEvents_.insert(name).second) return;
    const std::string path = root_.hostPath(kEventsFolder) + (name.empty() ? "" : "/" + name);
    log_.log(platform::LogLevel::error, "%s: %s", shownText(path).c_str(), what.c_str());
  };
  if (!folder) {
    if (!isMissing(folder.error())) say("", folder.error().text);
    return std::nullopt;
  }
  const auto names = root_.patience()([&] { return namesInFolder(folder->get()); });
  if (!names) {
    say("", names.error().text);
    return std::nullopt;
  }
  for (const std::string& name : *names) {
    if (name == kRejected || parsePendingName(name)) continue;
    const auto bytes = root_.readFile(kEventsFolder + ("/" + name), kMaxEventSize + 1);
    if (!bytes) {
      say(name, bytes.error().text);
      continue;
    }
    if (bytes->size() > kMaxEventSize) {
      const auto rejected = reject(folder->get(), name);
      say(name, rejected ? "longer than an event; moved to rejected/"
                         : "longer than an event, and can't be moved to rejected/: " +
                               rejected.error().text);
      continue;
    }
    // It stays for a caller with room for it.
    if (bytes->size() > buffer.size()) return failure(ENOMEM);
    // Taken first: an event that stays would be delivered again and again.
    if (const auto taken = take(folder->get(), name); !taken) {
      say(name, taken.error().text);
      return failure(static_cast<int>(taken.error().what));
    }
    return deliver(bytes->data(), bytes->size(), buffer);
  }
  return std::nullopt;
}

base::Result<void> Kernel::take(int folder, const std::string& name) const {
  return run_.isOn() ? renameNumbered(folder, name, folder, run_.nameFor(name))
                     : checked(::unlinkat(folder, name.c_str(), 0));
}

base::Result<void> Kernel::settle(const Done& done) {
  run_.end();
  const auto folder = root_.openFolder(kEventsFolder, DeviceRoot::Missing::fails);
  if (!folder && isMissing(folder.error())) return {};
  const auto names = folder ? namesInFolder(folder->get()) : folder.error();
  if (!names) return names.error().at(root_.hostPath(kEventsFolder));
  base::Result<void> settled;
  for (const std::string& name : *names) {
    const auto taken = parsePendingName(name);
    if (!taken) continue;
    auto dealt = done(taken->day) ? checked(::unlinkat(folder->get(), name.c_str(), 0))
                                  : renameNumbered(folder->get(), name, folder->get(), taken->name);
    if (settled) settled = std::move(dealt).at(root_.hostPath(kEventsFolder, name));
  }
  return settled;
}

std::uint64_t Kernel::pageSize() {
  const plist::Value* given = deviceValue("hw.pagesize");
  const plist::Number* size = given != nullptr ? given->as<plist::Number>() : nullptr;
  return size != nullptr ? size->uint64Value()
                         : static_cast<std::uint64_t>(::sysconf(_SC_PAGESIZE));
}

std::uint64_t Kernel::absoluteTime() {
  timespec time{};
  ::clock_gettime(CLOCK_MONOTONIC, &time);
  return static_cast<std::uint64_t>(time.tv_sec) * 1'000'000'000 +
         static_cast<std::uint64_t>(time.tv_nsec);
}

std::optional<platform::Kernel::Timebase> Kernel::timebase() { return Timebase{1, 1}; }

platform::Kernel::Process Kernel::process() { return {program_invocation_short_name, ::getpid()}; }

}  // namespace host::recorded
