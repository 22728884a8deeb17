// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/recorded/EccEventFiles.h"

#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <optional>
#include <system_error>

#include "host/files/Files.h"
#include "host/files/SystemError.h"

namespace host::recorded {

namespace {

constexpr char kEventsFolder[] = "device/ecc-events";
constexpr char kRejected[] = "rejected";
constexpr std::size_t kMaxEventSize = 72;

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

platform::Kernel::ReadResult failed(int error) { return {error, 0}; }

}  // namespace

std::optional<platform::Kernel::ReadResult> EccEventFiles::next(std::span<std::byte> buffer) {
  // Events are taken away, so the folder is one that is written to.
  const auto folder = root_.openFolder(kEventsFolder, DeviceRoot::Missing::fails);
  // The events are asked for until there is none: what is in the way is said once.
  const auto say = [this](const std::string& name, const std::string& what) {
    if (!said_.insert(name).second) return;
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
    if (bytes->size() > buffer.size()) return failed(ENOMEM);
    // Taken first: an event that stays would be delivered again and again.
    if (const auto taken = take(folder->get(), name); !taken) {
      say(name, taken.error().text);
      return failed(static_cast<int>(taken.error().what));
    }
    std::ranges::copy(std::as_bytes(std::span(*bytes)), buffer.begin());
    return platform::Kernel::ReadResult{0, bytes->size()};
  }
  return std::nullopt;
}

base::Result<void> EccEventFiles::take(int folder, const std::string& name) const {
  return root_.patience()([&] {
    return run_.isOn() ? renameNumbered(folder, name, folder, run_.nameFor(name))
                       : checked(::unlinkat(folder, name.c_str(), 0));
  });
}

base::Result<void> EccEventFiles::settle(const Done& done) {
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

}  // namespace host::recorded
