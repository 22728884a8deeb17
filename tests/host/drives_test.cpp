// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// This machine's drives, over made-up trees of the kernel's files and pages of drives.
#include <gtest/gtest.h>

#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>
#include <functional>
#include <limits>
#include <map>

#include "base/ByteReader.h"
#include "host/machine/DriveFigures.h"
#include "host/machine/DriveRecord.h"
#include "host/machine/DriveRegistry.h"
#include "host/machine/Drives.h"
#include "platform/testing/RecordingLog.h"
#include "support/MachineTree.h"

namespace {

using namespace host::machine;
using host::DeviceRoot;

constexpr std::uint64_t kMost = std::numeric_limits<std::uint64_t>::max();

std::map<std::uint32_t, std::uint64_t> recordsOf(const DriveFigures& figures) {
  std::map<std::uint32_t, std::uint64_t> records;
  const auto buffer = statisticsOf(figures);
  base::ByteReader reader(std::as_bytes(std::span(buffer)));
  while (const auto key = reader.read<std::uint32_t>()) {
    EXPECT_EQ(reader.read<std::uint32_t>(), 1u) << *key;
    EXPECT_TRUE(records.empty() || records.rbegin()->first < *key) << "keys ascend";
    records[*key] = reader.read<std::uint64_t>().value_or(0);
  }
  return records;
}

class Drives : public testing::Test, protected support::MachineTree {
 protected:
  std::vector<Drive> drives(std::optional<std::uint64_t> mount = std::nullopt) {
    return findDrives(DeviceRoot(folder.path().string()), mount);
  }
  std::string names(std::optional<std::uint64_t> mount = std::nullopt) {
    std::string names;
    for (const Drive& drive : drives(mount)) {
      names += drive.name + (drive.holdsRoot ? "* " : " ");
    }
    return names;
  }
};

TEST_F(Drives, AHealthLogBecomesRecordsThatSaturate) {
  const auto healthy = record(0);
  EXPECT_EQ(recordsOf(figuresOf(HealthLog(healthy.healthLog))),
            (std::map<std::uint32_t, std::uint64_t>{{2, 12},
                                                    {3, 11},
                                                    {4, 8000 * 125},
                                                    {7, 4000 * 125},
                                                    {10, 21},
                                                    {11, 3},
                                                    {34, 4321},
                                                    {36, 0},
                                                    {414, 0},
                                                    {431, 7},
                                                    {532, 100}}));
  auto page = healthy.healthLog;
  const struct {
    std::size_t offset;
    std::uint32_t key;
  } wide[] = {{64, 3}, {80, 2}, {112, 10}, {128, 34}, {144, 11}, {160, 414}};
  for (const auto& [offset, key] : wide) {
    support::put(page, offset, kMost, 8);
    EXPECT_EQ(recordsOf(figuresOf(HealthLog(page)))[key], kMost) << key;
    support::put(page, offset, 5, 16), support::put(page, offset + 15, 1);
    EXPECT_EQ(recordsOf(figuresOf(HealthLog(page)))[key], kMost) << key << ": beyond 64 bits";
  }
  for (const auto& [units, sectors] :
       {std::pair{kMost / 125, kMost / 125 * 125}, {kMost / 125 + 1, kMost}, {kMost, kMost}}) {
    support::put(page, 48, units, 16);
    EXPECT_EQ(recordsOf(figuresOf(HealthLog(page)))[4], sectors) << units;
  }
  support::put(page, 3, 0, 2);
  EXPECT_EQ(recordsOf(figuresOf(HealthLog(page))).count(532), 0u) << "no spare is counted";
  EXPECT_EQ(figureNamed(figuresOf(HealthLog(healthy.healthLog)), "temperatureSensor1"),
            std::nullopt);
}

TEST_F(Drives, LifeTimesAreWhatIsUsedAtLeast) {
  using Estimate = std::optional<std::uint64_t>;
  const struct {
    Estimate lifeTimeA, lifeTimeB, endOfLife, used;
    std::size_t figures;
  } rows[] = {{1, 1, 1, 0, 4},  {2, 5, 1, 40, 4},    {11, 1, 3, 100, 4},  {0, 10, 0, 90, 2},
              {0, 0, 2, {}, 1}, {{}, {}, {}, {}, 0}, {12, 255, 4, {}, 0}, {kMost, 3, 1, 20, 3}};
  for (const auto& row : rows) {
    const auto figures = figuresOfLifeTime(row.lifeTimeA, row.lifeTimeB, row.endOfLife);
    EXPECT_EQ(figureNamed(figures, "percentageUsed"), row.used);
    EXPECT_EQ(figures.size(), row.figures);
    EXPECT_EQ(recordsOf(figures).size(), row.used ? 1u : 0u) << "nothing else is a counter";
  }
}

TEST_F(Drives, OnlyARecordOfThisDriveAndBootByTheMachinesOwnerCounts) {
  nvme("nvme0", 0);
  const auto path = folder / "run/morvend/drives/nvme0.plist";
  const auto unknown = [this] {
    const auto found = drives();
    return found.size() == 1 ? found.front().unknown : "no drive";
  };
  EXPECT_EQ(unknown(), "its health log wasn't recorded");
  write("nvme0", record(0));
  EXPECT_EQ(unknown(), "");
  EXPECT_EQ(drives().front().capacity, 1'024'000'000'000u);
  EXPECT_EQ(std::filesystem::status(path).permissions(), std::filesystem::perms(0644))
      << "who reads it has no rights";

  const auto written = [&](auto change) {
    auto changed = record(0);
    change(changed);
    write("nvme0", changed);
  };
  const auto secondsAfter = [&](int seconds) {
    written(
        [&](DriveRecord& changed) { changed.moment.sinceBoot = std::chrono::seconds(seconds); });
  };
  const struct {
    std::function<void()> make;
    const char* why;
  } rows[] = {
      {[&] { secondsAfter(100'000 - 86'400); }, ""},
      {[&] { secondsAfter(100'000 - 86'401); }, "it is too old"},
      {[&] { secondsAfter(100'001); }, "it is of another boot of this machine"},
      {[&] { secondsAfter(-1); }, "it is of another boot of this machine"},
      {[&] { written([](DriveRecord& other) { other.moment.boot = "another"; }); },
       "it is of another boot of this machine"},
      {[&] { written([](DriveRecord& other) { support::putText(other.identify, 4, "S1", 20); }); },
       "it is of another drive"},
      {[&] { written([](DriveRecord& other) { support::putText(other.identify, 24, "X", 40); }); },
       "it is of another drive"},
      {[&] { folder.write("run/morvend/drives/nvme0.plist", "<plist><dict/></plist>"); },
       "it is no record of a drive"},
      {[&] { folder.write("run/morvend/drives/nvme0.plist", std::string(32769, ' ')); },
       "it is too long"},
      {[&] { written([](DriveRecord&) {}), ::chmod(path.c_str(), 0664); },
       "others may write to it"},
      {[&] {
         std::filesystem::rename(path, folder / "elsewhere");
         std::filesystem::create_symlink("../../../elsewhere", path);
       },
       "too many links, or one where none is followed"},
      {[&] {
         std::filesystem::remove(path);
         ::mkfifo(path.c_str(), 0600);
       },
       "not a regular file"},
  };
  for (const auto& [make, why] : rows) {
    make();
    EXPECT_EQ(unknown(), *why == '\0' ? "" : std::string("its recorded health log: ") + why);
  }
  std::filesystem::remove(path);
  write("nvme0", record(0));
  if (::geteuid() == 0) {
    ASSERT_EQ(::chown(path.c_str(), 1234, 1234), 0);
    EXPECT_EQ(unknown(), "its recorded health log: it belongs to another user");
  }
  std::filesystem::remove_all(folder / "run/morvend");
  std::filesystem::create_directory(folder / "attic");
  std::filesystem::create_directory_symlink("../attic", folder / "run/morvend");
  EXPECT_EQ(unknown(), "its recorded health log: too many links, or one where none is followed");
}

TEST_F(Drives, ARecordIsReadOnlyWhole) {
  const std::string bytes = *bytesOf(record(0));
  EXPECT_EQ(readDriveRecord(bytes)->moment.sinceBoot.count(), 99'000);
  EXPECT_EQ(readDriveRecord(bytes)->healthLog, record(0).healthLog);
  for (std::size_t length = 0; length + 10 < bytes.size(); length += 7) {
    EXPECT_FALSE(readDriveRecord(bytes.substr(0, length))) << length;
  }
  for (const char* key : {"Boot", "SecondsSinceBoot", "HealthLog", "Identify"}) {
    std::string without = bytes;
    without.replace(without.find(std::string("<key>") + key), 6, "<key>x");
    EXPECT_FALSE(readDriveRecord(without)) << key;
  }
}

TEST_F(Drives, TheDriveThatHoldsTheRootComesFirst) {
  nvme("nvme0", 0), nvme("nvme2", 2), nvme("nvme10", 10);
  EXPECT_EQ(names(), "nvme0 nvme2 nvme10 ");
  mount("30 1 261:2 / / rw shared:1 - ext4 /dev/nvme2n1p2 rw");
  EXPECT_EQ(names(30), "nvme2* nvme0 nvme10 ");
  EXPECT_EQ(names(31), "nvme0 nvme2 nvme10 ") << "another mount";
  // A volume of two drives, one of them behind an encrypted partition; the file system has no
  // number of its own.
  block("devices/virtual/block/dm-0", "253:0", 10);
  block("devices/virtual/block/dm-1", "253:1", 10);
  files("devices/virtual/block/dm-1", {{"dm/name", "group-root"}});
  link("sys/devices/virtual/block/dm-1/slaves/dm-0", "../../dm-0");
  link("sys/devices/virtual/block/dm-1/slaves/nvme2n1p1", "..");
  link("sys/devices/virtual/block/dm-0/slaves/nvme10n1p1", "..");
  mount("30 1 0:44 /sub / rw - btrfs /dev/mapper/group-root rw");
  EXPECT_EQ(names(30), "nvme2* nvme10* nvme0 ");
  // A circle ends.
  link("sys/devices/virtual/block/dm-0/slaves/dm-1", "..");
  EXPECT_EQ(names(30), "nvme2* nvme10* nvme0 ");
  // A disk of another kind is said only if the root lies on it.
  block("devices/pci0/virtio1/block/vda", "254:0", 4);
  EXPECT_EQ(names(30), "nvme2* nvme10* nvme0 ");
  mount("30 1 254:0 / / rw - ext4 /dev/vda rw");
  EXPECT_EQ(names(30), "vda* nvme0 nvme2 nvme10 ");
  EXPECT_FALSE(drives(30).front().isFlash);
  mount("30 1 0:50 / / rw - overlay overlay rw");
  EXPECT_EQ(names(30), "nvme0 nvme2 nvme10 ");
}

TEST_F(Drives, NamespacesOfSeveralPathsCountOnceAndNetworksNot) {
  nvme("nvme0", 0, 1000);
  const std::string place = "devices/pci0/nvme0/nvme/nvme0/nvme0c0n2";
  block(place, "0:1", 5000);
  files(place, {{"hidden", "1"}});
  block("devices/virtual/nvme-subsystem/nvme-subsys0/nvme0n2", "259:9", 5000);
  link("sys/class/nvme-subsystem/nvme-subsys0",
       "../../devices/virtual/nvme-subsystem/nvme-subsys0");
  link("sys/devices/virtual/nvme-subsystem/nvme-subsys0/nvme0", "../../../pci0/nvme0/nvme/nvme0");
  files("devices/net/nvme1", {{"transport", "tcp"}, {"model", "elsewhere"}});
  link("sys/class/nvme/nvme1", "../../devices/net/nvme1");
  mount("30 1 259:9 / / rw - ext4 /dev/nvme0n2 rw");
  EXPECT_EQ(names(30), "nvme0* ");
  EXPECT_EQ(drives().front().capacity, 6000u * 512);
}

TEST_F(Drives, WhatTheKernelTellsItselfNeedsNoRecord) {
  files("devices/soc/mmc0/mmc0:0001", {{"type", "MMC"},
                                       {"name", "EM16"},
                                       {"serial", "0x1234"},
                                       {"fwrev", "0x5"},
                                       {"life_time", "0x03 0x02"},
                                       {"pre_eol_info", "0x01"}});
  files("devices/soc/mmc1/mmc1:0001", {{"type", "SD"}, {"life_time", "0x03 0x02"}});
  for (const char* number : {"0", "1"}) {
    const std::string card = std::string("mmc") + number + "/mmc" + number + ":0001";
    link("sys/bus/mmc/devices/" + card.substr(5), "../../../devices/soc/" + card);
  }
  block("devices/soc/mmc0/mmc0:0001/block/mmcblk0", "179:0", 100);
  const std::string controller = "devices/soc/1d84000.ufs";
  files(controller, {{"health_descriptor/eol_info", "0x02"},
                     {"health_descriptor/life_time_estimation_a", "0x0B"},
                     {"health_descriptor/life_time_estimation_b", "0x00"},
                     {"string_descriptors/product_name", "UF128"}});
  link("sys/" + controller + "/host0/scsi_host/host0/device", "../../../host0");
  link("sys/class/scsi_host/host0", "../../" + controller + "/host0/scsi_host/host0");
  block(controller + "/host0/target0:0:0/0:0:0:0/block/sda", "8:0", 200);
  const auto found = drives();
  ASSERT_EQ(found.size(), 2u);
  EXPECT_EQ(found[0].name + found[0].kind + found[0].model, "sdaUFSUF128");
  EXPECT_EQ(figureNamed(found[0].figures, "percentageUsed"), 100u);
  EXPECT_EQ(figureNamed(found[0].figures, "endOfLife"), 2u);
  EXPECT_EQ(found[1].name + found[1].kind + found[1].model, "mmcblk0eMMCEM16");
  EXPECT_EQ(figureNamed(found[1].figures, "percentageUsed"), 20u);
  EXPECT_EQ(found[1].capacity, 51'200u);
}

TEST_F(Drives, TheRegistryAnswersTheStatisticsCommandAndNoOther) {
  nvme("nvme0", 0), nvme("nvme1", 1);
  write("nvme0", record(0));
  platform::fakes::RecordingLog log;
  const DeviceRoot root(folder.path().string());
  DriveRegistry registry(root, root, log);
  const auto iterator = registry.createIterator();
  const auto call = [&](platform::DriverConnection connection, std::uint32_t method,
                        std::uint32_t opType, std::span<std::byte> output) {
    const std::uint32_t words[6] = {opType};
    return registry.DrvCallStructMethod(connection, method, std::as_bytes(std::span(words)),
                                        output);
  };
  for (const bool answers : {true, false}) {
    const auto entry = registry.next(iterator);
    EXPECT_TRUE(registry.conformsTo(entry, "ZMCStorage"));
    const auto connection = registry.DrvServiceOpen(entry, 0).connection;
    EXPECT_NE(connection, 0u);
    std::vector<std::byte> output(4096);
    const auto result = call(connection, 8, 13, output);
    EXPECT_EQ(result.status, answers ? 0u : 0x2Du);
    EXPECT_EQ(result.outputSize, answers ? 11u * 16 : 0u);
    for (const std::uint32_t opType : {10u, 15u, 17u, 22u, 39u, 145u, 221u}) {
      EXPECT_EQ(call(connection, 8, opType, output).status, 0x2Du) << opType;
    }
    EXPECT_EQ(call(connection, 5, 0, output).status, 0x2Du);
    registry.DrvServiceClose(connection);
    registry.release(entry);
  }
  registry.release(iterator);
  EXPECT_EQ(log.lines(), std::vector<std::string>{
                             "default: The health of nvme1 isn't known: its health log wasn't "
                             "recorded"});
}

}  // namespace
