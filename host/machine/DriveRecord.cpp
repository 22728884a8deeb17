// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/machine/DriveRecord.h"

#include <fcntl.h>
#include <sys/stat.h>

#include <algorithm>
#include <cstdint>
#include <span>
#include <utility>

#include "base/Text.h"
#include "host/files/FileDescriptor.h"
#include "host/files/Files.h"
#include "host/files/SystemError.h"
#include "host/machine/SourceFiles.h"
#include "plist/PropertyList.h"
#include "plist/Value.h"

namespace host::machine {

namespace {

using namespace std::chrono_literals;

constexpr char kBoot[] = "Boot", kSinceBoot[] = "SecondsSinceBoot", kHealthLog[] = "HealthLog",
               kIdentify[] = "Identify";

base::Error wrong(std::string text) { return {std::move(text)}; }

plist::Data dataOf(std::span<const std::byte> bytes) {
  plist::Data data(bytes.size());
  std::ranges::transform(bytes, data.begin(), [](std::byte byte) { return std::uint8_t(byte); });
  return data;
}

// Whether the data has the size of the page, which it then fills.
bool fill(std::span<std::byte> page, const plist::Data* data) {
  if (data == nullptr || data->size() != page.size()) return false;
  std::ranges::copy(std::as_bytes(std::span(*data)), page.begin());
  return true;
}

base::Result<std::string> trustedBytes(const DeviceRoot& files, const std::string& name) {
  struct stat machine, status;
  const auto root = files.openFolder("", DeviceRoot::Missing::fails);
  if (!root || ::fstat(root->get(), &machine) != 0) return systemError();
  const auto folder = files.openFolder(kDriveRecords, DeviceRoot::Missing::fails);
  if (!folder) return folder.error();
  const FileDescriptor file(::openat(folder->get(), name.c_str(),
                                     O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC));
  if (!file || ::fstat(file.get(), &status) != 0) return systemError();
  if (!S_ISREG(status.st_mode)) return notRegular();
  if (status.st_uid != machine.st_uid) return wrong("it belongs to another user");
  if ((status.st_mode & (S_IWGRP | S_IWOTH)) != 0) return wrong("others may write to it");
  if (std::cmp_greater(status.st_size, kMaxDriveRecord)) return wrong("it is too long");
  return readRegularFile(file.get(), kMaxDriveRecord);
}

base::Result<DriveRecord> checkedRecord(DriveRecord record, const base::Result<MachineMoment>& now,
                                        std::string_view model, std::string_view serial) {
  if (!now) return now.error();
  const auto [boot, sinceBoot] = record.moment;
  if (boot != now->boot || sinceBoot < 0s || sinceBoot > now->sinceBoot) {
    return wrong("it is of another boot of this machine");
  }
  if (now->sinceBoot - sinceBoot > kMaxAgeOfRecord) return wrong("it is too old");
  const DriveIdentity identity = identityOf(record.identify);
  if (identity.model != model || identity.serial != serial) return wrong("it is of another drive");
  return record;
}

}  // namespace

base::Result<MachineMoment> momentOf(const DeviceRoot& files) {
  constexpr char kBootPath[] = "proc/sys/kernel/random/boot_id", kUptimePath[] = "proc/uptime";
  const auto boot = sourceLine(files, kBootPath);
  if (!boot) return wrong(std::string("/") + kBootPath + " can't be read");
  const auto line = sourceLine(files, kUptimePath);
  std::string_view rest = line ? std::string_view(*line) : std::string_view();
  const auto seconds = countIn(takeUntil(rest, '.'));
  constexpr std::uint64_t kCentury = std::uint64_t{100} * 366 * 86'400;
  if (!seconds || *seconds > kCentury)
    return wrong(std::string("/") + kUptimePath + " can't be read");
  return MachineMoment{*boot, std::chrono::seconds(*seconds)};
}

base::Result<std::string> bytesOf(const DriveRecord& record) {
  return plist::writeXML(
      plist::Dictionary{{kBoot, record.moment.boot},
                        {kSinceBoot, std::int64_t{record.moment.sinceBoot.count()}},
                        {kHealthLog, dataOf(record.healthLog)},
                        {kIdentify, dataOf(record.identify)}});
}

base::Result<DriveRecord> readDriveRecord(std::string_view bytes) {
  if (bytes.size() > kMaxDriveRecord) return wrong("it is too long");
  const auto value = plist::read(bytes);
  if (!value) return value.error();
  const auto* content = value->as<plist::Dictionary>();
  const std::string* boot = content != nullptr ? content->text(kBoot) : nullptr;
  const plist::Number* seconds = content != nullptr ? content->number(kSinceBoot) : nullptr;
  DriveRecord record;
  if (boot == nullptr || seconds == nullptr || !fill(record.healthLog, content->data(kHealthLog)) ||
      !fill(record.identify, content->data(kIdentify))) {
    return wrong("it is no record of a drive");
  }
  record.moment = {*boot, std::chrono::seconds(seconds->int64Value())};
  return record;
}

std::string recordNameOf(std::string_view drive) { return std::string(drive) + ".plist"; }

base::Result<void> writeDriveRecord(int folder, std::string_view drive, const DriveRecord& record) {
  return bytesOf(record).and_then([&](const std::string& bytes) {
    return replaceReadableFile(folder, recordNameOf(drive), bytes);
  });
}

base::Result<DriveRecord> findDriveRecord(const DeviceRoot& files, std::string_view drive,
                                          std::string_view model, std::string_view serial) {
  const std::string name = recordNameOf(drive);
  if (!isPlainFileName(name, kMaxFileName)) return wrong("there is no such drive");
  auto bytes = trustedBytes(files, name);
  if (!bytes && isMissing(bytes.error())) return wrong("its health log wasn't recorded");
  return std::move(bytes)
      .and_then(readDriveRecord)
      .and_then([&](DriveRecord record) {
        return checkedRecord(std::move(record), momentOf(files), model, serial);
      })
      .at("its recorded health log");
}

}  // namespace host::machine
