// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/recorder/RecordDrives.h"

#include <libnvme.h>
#include <sys/stat.h>

#include <optional>
#include <string>
#include <string_view>

#include "base/Text.h"
#include "host/files/FileDescriptor.h"
#include "host/files/SystemError.h"
#include "host/machine/DriveRecord.h"
#include "host/machine/Drives.h"

namespace recorder {

namespace {

using host::DeviceRoot;
using host::machine::DriveRecord;

static_assert(sizeof(nvme_smart_log) == host::machine::kHealthLogSize);
static_assert(sizeof(nvme_id_ctrl) == host::machine::kIdentifySize);

// The folder of the records, made for everybody to look into: the host's own are for their owner.
base::Result<host::FileDescriptor> openRecords(const DeviceRoot& machine) {
  const std::string_view path = host::machine::kDriveRecords;
  for (std::size_t end = 0; end != std::string_view::npos;) {
    end = path.find('/', end + 1);
    const std::string_view folder = path.substr(0, end);
    if (machine.openFolder(folder, DeviceRoot::Missing::fails)) continue;
    const auto made = machine.openFolder(folder, DeviceRoot::Missing::create);
    if (!made) return made.error();
    if (const auto shown = host::checked(::fchmod(made->get(), 0755)); !shown) return shown.error();
  }
  return machine.openFolder(path, DeviceRoot::Missing::create);
}

// What a command came to: -1 with an error number, or what the drive says.
base::Result<void> answered(int result, const char* what) {
  if (result == 0) return {};
  if (result < 0) return host::systemError().at(what);
  return base::Error{
      base::format("%s: the drive answers with status 0x%x", what, static_cast<unsigned>(result))};
}

base::Result<void> record(const DeviceRoot& machine, int folder, const std::string& drive) {
  const auto now = host::machine::momentOf(machine);
  if (!now) return now.error();
  const std::string path = "dev/" + drive;
  const auto device = machine.openForReading(path);
  if (!device) return device.error().at("/" + path);
  DriveRecord record{.moment = *now};
  auto* log = reinterpret_cast<nvme_smart_log*>(record.healthLog.data());
  auto* identity = reinterpret_cast<nvme_id_ctrl*>(record.identify.data());
  return answered(nvme_get_log_smart(device->get(), NVME_NSID_ALL, false, log), "its health log")
      .and_then(
          [&] { return answered(nvme_identify_ctrl(device->get(), identity), "its identity"); })
      .and_then([&] { return host::machine::writeDriveRecord(folder, drive, record); });
}

}  // namespace

base::Result<nandinfo::RecordedDrives> recordDrives(const DeviceRoot& machine) {
  nandinfo::RecordedDrives results;
  std::optional<base::Result<host::FileDescriptor>> folder;
  for (const auto& drive : host::machine::findDrives(machine, std::nullopt)) {
    if (std::string_view(drive.kind) != "NVMe") continue;
    if (!folder) folder.emplace(openRecords(machine));
    if (!*folder) return folder->error().at(machine.hostPath(host::machine::kDriveRecords));
    results.emplace_back(drive.name, record(machine, (*folder)->get(), drive.name));
  }
  return results;
}

}  // namespace recorder
