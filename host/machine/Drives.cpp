// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/machine/Drives.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cstddef>
#include <set>
#include <string_view>
#include <tuple>
#include <utility>

#include "base/Text.h"
#include "host/machine/DriveRecord.h"
#include "host/machine/SourceFiles.h"

namespace host::machine {

namespace {

constexpr std::size_t kMaxMounts = std::size_t{1} << 20;  // bytes of the list
constexpr int kMaxLayers = 8;                             // of mapped devices above each other
constexpr std::uint64_t kSectorSize = 512;                // of all sizes that the kernel tells

std::string textOf(const DeviceRoot& files, const std::string& path) {
  return sourceLine(files, path).value_or("");
}

// What a link in a folder holds; empty when there is none.
std::string linkIn(const DeviceRoot& files, const std::string& folder, const std::string& name) {
  const auto opened =
      files.openFolder(folder, DeviceRoot::Missing::fails, DeviceRoot::Links::followed);
  if (!opened) return {};
  std::array<char, 4096> target;
  const ssize_t length = ::readlinkat(opened->get(), name.c_str(), target.data(), target.size());
  return length > 0 ? std::string(target.data(), static_cast<std::size_t>(length)) : std::string();
}

std::string lastPart(const std::string& path) { return path.substr(path.rfind('/') + 1); }

bool isBelow(const std::string& path, const std::string& part) {
  return path.find("/" + part + "/") != std::string::npos;
}

// A block device with the place of its device in the kernel's tree.
struct Block {
  std::string name, path;
};

class Machine {
 public:
  explicit Machine(const DeviceRoot& files) : files_(files) {
    for (std::string& name : sourceNames(files, kBlocks)) {
      std::string path = linkIn(files, kBlocks, name);
      blocks_.push_back({std::move(name), std::move(path)});
    }
  }

  std::vector<Drive> drives(std::optional<std::uint64_t> rootMount) {
    if (rootMount) addDisksOf(deviceOfMount(*rootMount), kMaxLayers);
    addNVMe();
    addMMC();
    addUFS();
    addRest();
    std::ranges::stable_sort(drives_, {}, [](const Drive& drive) {
      return std::make_tuple(!drive.holdsRoot, std::string(drive.kind), drive.name.size(),
                             drive.name);
    });
    return std::move(drives_);
  }

 private:
  static constexpr char kBlocks[] = "sys/class/block";

  // The block device of a mount. Some file systems have none, but a source that is one.
  std::string deviceOfMount(std::uint64_t mount) const {
    const std::string mounts = sourceText(files_, "proc/self/mountinfo", kMaxMounts).value_or("");
    for (std::string_view rest = mounts; !rest.empty();) {
      std::string_view line = takeUntil(rest, '\n');
      if (countIn(takeWord(line)) != mount) continue;
      takeWord(line);
      const std::string number(takeWord(line));
      if (!number.starts_with("0:")) return lastPart(linkIn(files_, "sys/dev/block", number));
      const auto separator = line.find(" - ");
      if (separator == std::string_view::npos) return {};
      line.remove_prefix(separator + 3);
      takeWord(line);
      return deviceNamed(std::string(takeWord(line)));
    }
    return {};
  }

  std::string deviceNamed(const std::string& source) const {
    if (!source.starts_with("/dev/")) return {};
    const std::string name = lastPart(source);
    for (const Block& block : blocks_) {
      const std::string folder = std::string(kBlocks) + "/" + block.name;
      if (block.name == name || textOf(files_, folder + "/dm/name") == name) return block.name;
    }
    return {};
  }

  // The disks on which a block device lies: through what it is mapped to, and what it is a part of.
  void addDisksOf(const std::string& name, int layers) {
    const auto block = std::ranges::find(blocks_, name, &Block::name);
    if (block == blocks_.end() || layers == 0) return;
    const std::string folder = std::string(kBlocks) + "/" + name;
    const auto below = sourceNames(files_, folder + "/slaves");
    for (const std::string& next : below) addDisksOf(next, layers - 1);
    if (!below.empty()) return;
    if (!sourceCount(files_, folder + "/partition")) {
      rootDisks_.insert(name);
      return;
    }
    const std::string disk = block->path.substr(0, block->path.rfind('/'));
    addDisksOf(lastPart(disk), layers - 1);
  }

  // Takes the disks below a part of the kernel's tree as the drive's: the first one's name where it
  // has none of its own, their sizes, and whether the root lies on one.
  void addDisks(Drive& drive, const std::string& part) {
    for (const auto& [name, path] : blocks_) {
      const std::string folder = std::string(kBlocks) + "/" + name;
      if (!isBelow(path, part) || sourceCount(files_, folder + "/partition")) continue;
      if (sourceCount(files_, folder + "/hidden").value_or(0) != 0) continue;
      if (drive.name.empty()) drive.name = name;
      drive.holdsRoot |= rootDisks_.erase(name) > 0;
      capacityOfDisks_ += sourceCount(files_, folder + "/size").value_or(0) * kSectorSize;
    }
  }

  void addNVMe() {
    constexpr std::string_view kFabrics[] = {"tcp", "rdma", "fc", "loop"};
    const auto subsystems = sourceNames(files_, "sys/class/nvme-subsystem");
    for (const std::string& name : sourceNames(files_, "sys/class/nvme")) {
      const std::string folder = "sys/class/nvme/" + name + "/";
      if (std::ranges::count(kFabrics, textOf(files_, folder + "transport")) > 0) continue;
      Drive drive{.name = name,
                  .kind = "NVMe",
                  .model = textOf(files_, folder + "model"),
                  .serial = textOf(files_, folder + "serial"),
                  .firmware = textOf(files_, folder + "firmware_rev")};
      capacityOfDisks_ = 0;
      addDisks(drive, name);
      for (const std::string& subsystem : subsystems) {
        const std::string below = "sys/class/nvme-subsystem/" + subsystem;
        if (!linkIn(files_, below, name).empty()) addDisks(drive, subsystem);
      }
      drive.capacity = capacityOfDisks_;
      const auto record = findDriveRecord(files_, name, drive.model, drive.serial);
      if (record) {
        drive.figures = figuresOf(record->healthLog);
        const std::uint64_t capacity = identityOf(record->identify).capacity;
        if (capacity != 0) drive.capacity = capacity;
      } else {
        drive.unknown = record.error().text;
      }
      drives_.push_back(std::move(drive));
    }
  }

  void addMMC() {
    for (const std::string& name : sourceNames(files_, "sys/bus/mmc/devices")) {
      const std::string folder = "sys/bus/mmc/devices/" + name + "/";
      if (textOf(files_, folder + "type") != "MMC") continue;
      // Both estimates stand in one line.
      const std::string estimates = textOf(files_, folder + "life_time");
      std::string_view rest = estimates;
      const auto lifeTimeA = countIn(takeWord(rest)), lifeTimeB = countIn(takeWord(rest));
      Drive drive{.kind = "eMMC",
                  .model = textOf(files_, folder + "name"),
                  .serial = textOf(files_, folder + "serial"),
                  .firmware = textOf(files_, folder + "fwrev"),
                  .figures = figuresOfLifeTime(lifeTimeA, lifeTimeB,
                                               sourceCount(files_, folder + "pre_eol_info"))};
      add(std::move(drive), name);
    }
  }

  void addUFS() {
    for (const std::string& name : sourceNames(files_, "sys/class/scsi_host")) {
      const std::string folder = "sys/class/scsi_host/" + name + "/device/../";
      const std::string health = folder + "health_descriptor/";
      if (sourceNames(files_, health).empty()) continue;
      Drive drive{
          .kind = "UFS",
          .model = textOf(files_, folder + "string_descriptors/product_name"),
          .serial = textOf(files_, folder + "string_descriptors/serial_number"),
          .firmware = textOf(files_, folder + "string_descriptors/product_revision"),
          .figures = figuresOfLifeTime(sourceCount(files_, health + "life_time_estimation_a"),
                                       sourceCount(files_, health + "life_time_estimation_b"),
                                       sourceCount(files_, health + "eol_info"))};
      add(std::move(drive), name);
    }
  }

  // A drive whose figures the kernel tells itself.
  void add(Drive drive, const std::string& part) {
    capacityOfDisks_ = 0;
    addDisks(drive, part);
    drive.capacity = capacityOfDisks_;
    if (drive.name.empty()) drive.name = part;
    if (drive.figures.empty()) drive.unknown = "it doesn't tell how much of its life time is used";
    drives_.push_back(std::move(drive));
  }

  // What else the root lies on.
  void addRest() {
    for (const std::string& name : rootDisks_) {
      const std::string folder = std::string(kBlocks) + "/" + name + "/";
      drives_.push_back(
          {.name = name,
           .kind = "disk",
           .model = textOf(files_, folder + "device/model"),
           .capacity = sourceCount(files_, folder + "size").value_or(0) * kSectorSize,
           .holdsRoot = true,
           .unknown = "it is no NVMe, eMMC or UFS drive, and what it tells isn't read",
           .isFlash = false});
    }
  }

  const DeviceRoot& files_;
  std::vector<Block> blocks_;
  std::set<std::string> rootDisks_;  // that no drive has claimed yet
  std::vector<Drive> drives_;
  std::uint64_t capacityOfDisks_ = 0;
};

}  // namespace

std::optional<std::uint64_t> mountOf(const DeviceRoot& folder) {
  const auto opened = folder.openFolder("", DeviceRoot::Missing::fails);
  struct statx status;
  if (!opened || ::statx(opened->get(), "", AT_EMPTY_PATH, STATX_MNT_ID, &status) != 0 ||
      (status.stx_mask & STATX_MNT_ID) == 0) {
    return std::nullopt;
  }
  return status.stx_mnt_id;
}

std::vector<Drive> findDrives(const DeviceRoot& files, std::optional<std::uint64_t> rootMount) {
  return Machine(files).drives(rootMount);
}

}  // namespace host::machine
