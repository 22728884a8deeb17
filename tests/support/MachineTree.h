// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// A made-up machine with drives: the files of its kernel below a folder, and a drive's pages.
#pragma once

#include <array>
#include <chrono>
#include <cstddef>
#include <cstdint>
#include <filesystem>
#include <string>
#include <utility>
#include <vector>

#include "host/files/DeviceRoot.h"
#include "host/machine/DriveRecord.h"
#include "support/TemporaryFolder.h"

namespace support {

// A number in a page, low byte first.
template <std::size_t size>
void put(std::array<std::byte, size>& page, std::size_t offset, std::uint64_t value,
         std::size_t width = 1) {
  for (std::size_t i = 0; i < width; ++i) {
    page[offset + i] = static_cast<std::byte>(i < 8 ? value >> (8 * i) : 0);
  }
}

template <std::size_t size>
void putText(std::array<std::byte, size>& page, std::size_t offset, std::string text,
             std::size_t width) {
  text.resize(width, ' ');
  for (std::size_t i = 0; i < width; ++i) page[offset + i] = static_cast<std::byte>(text[i]);
}

struct MachineTree {
  static constexpr char kBoot[] = "6f9d2f0e-0000-4000-8000-000000000001";

  MachineTree() {
    folder.write("proc/sys/kernel/random/boot_id", std::string(kBoot) + "\n");
    folder.write("proc/uptime", "100000.42 1.00\n");
  }

  // Files of a device with their contents, below its place in the kernel's tree.
  void files(const std::string& place,
             const std::vector<std::pair<std::string, std::string>>& contents) {
    for (const auto& [name, text] : contents)
      folder.write("sys/" + place + "/" + name, text + "\n");
  }
  void link(const std::string& at, const std::string& target) {
    std::filesystem::create_directories((folder / at).parent_path());
    std::filesystem::create_directory_symlink(target, folder / at);
  }
  // A block device at its place, of so many sectors, under its class and its number.
  void block(const std::string& place, const char* number, std::uint64_t sectors) {
    const std::string name = place.substr(place.rfind('/') + 1);
    files(place, {{"size", std::to_string(sectors)}});
    link("sys/class/block/" + name, "../../" + place);
    link(std::string("sys/dev/block/") + number, "../../" + place);
  }
  void mount(const std::string& line) { folder.write("proc/self/mountinfo", line + "\n"); }

  // An NVMe drive as the kernel lists it, with one namespace and two partitions.
  void nvme(const std::string& name, int number, std::uint64_t sectors = 2'000'000) {
    const std::string place = "devices/pci0/" + name + "/nvme/" + name;
    files(place, {{"model", "Flash One  "},
                  {"serial", "S" + std::to_string(number)},
                  {"firmware_rev", "1.0"},
                  {"transport", "pcie"}});
    link("sys/class/nvme/" + name, "../../" + place);
    const std::string prefix = std::to_string(259 + number) + ":";
    block(place + "/" + name + "n1", (prefix + "0").c_str(), sectors);
    for (const char* part : {"1", "2"}) {
      const std::string at = place + "/" + name + "n1/" + name + "n1p" + part;
      block(at, (prefix + part).c_str(), 1000);
      files(at, {{"partition", part}});
    }
  }

  // What reading that drive comes to: a healthy one's pages, a while ago.
  static host::machine::DriveRecord record(int number) {
    host::machine::DriveRecord record{{kBoot, std::chrono::seconds(99'000)}};
    putText(record.identify, 4, "S" + std::to_string(number), 20);
    putText(record.identify, 24, "Flash One", 40);
    putText(record.identify, 64, "1.0", 8);
    put(record.identify, 280, 1'024'000'000'000, 16);
    put(record.healthLog, 1, 310, 2);
    put(record.healthLog, 3, 100), put(record.healthLog, 4, 10), put(record.healthLog, 5, 7);
    put(record.healthLog, 32, 4000, 16), put(record.healthLog, 48, 8000, 16);
    put(record.healthLog, 64, 11, 16), put(record.healthLog, 80, 12, 16);
    put(record.healthLog, 112, 21, 16), put(record.healthLog, 128, 4321, 16);
    put(record.healthLog, 144, 3, 16);
    return record;
  }
  void write(const std::string& name, const host::machine::DriveRecord& record) {
    const host::DeviceRoot machine(folder.path().string());
    const auto into =
        machine.openFolder(host::machine::kDriveRecords, host::DeviceRoot::Missing::create);
    (void)host::machine::writeDriveRecord(into->get(), name, record);
  }

  TemporaryFolder folder;
};

}  // namespace support
