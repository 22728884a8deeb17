// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What was read of an NVMe drive with the rights that this takes, for those who don't have them.
//
// A property list for each drive, run/morvend/drives/<name>.plist, whole or not there. It is
// written by root; who reads it believes none of it: bytes beyond the bounds, of another shape, of
// another drive, boot or owner count as nothing, and the error says which.
#pragma once

#include <array>
#include <chrono>
#include <cstddef>
#include <string>
#include <string_view>

#include "base/Result.h"
#include "host/files/DeviceRoot.h"
#include "host/machine/DriveFigures.h"

namespace host::machine {

inline constexpr char kDriveRecords[] = "run/morvend/drives";
inline constexpr std::size_t kMaxDriveRecord = std::size_t{32} << 10;

// Records are made every hour; after this long nobody makes them any more.
inline constexpr std::chrono::seconds kMaxAgeOfRecord = std::chrono::hours(24);

// A moment of a machine that no setting of its clock moves.
struct MachineMoment {
  std::string boot;  // the boot session's identifier
  std::chrono::seconds sinceBoot = {};
};

// The present one; the error says which file of the kernel's has no answer.
base::Result<MachineMoment> momentOf(const DeviceRoot& files);

struct DriveRecord {
  MachineMoment moment;  // at which it was read
  std::array<std::byte, kHealthLogSize> healthLog = {};
  std::array<std::byte, kIdentifySize> identify = {};
};

base::Result<std::string> bytesOf(const DriveRecord& record);
base::Result<DriveRecord> readDriveRecord(std::string_view bytes);

// The name of a drive's record in the folder.
std::string recordNameOf(std::string_view drive);

// Makes or replaces the record of a drive in an open folder.
base::Result<void> writeDriveRecord(int folder, std::string_view drive, const DriveRecord& record);

// The record of the drive with that name, model and serial number, if it was read in this boot and
// not too long ago. Only a file counts that belongs to the owner of the machine's own root folder,
// and that nobody else may write to.
base::Result<DriveRecord> findDriveRecord(const DeviceRoot& files, std::string_view drive,
                                          std::string_view model, std::string_view serial);

}  // namespace host::machine
