// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/mkdevice/SampleController.h"

#include <algorithm>

#include "base/Text.h"
#include "platform/DeviceRegistry.h"
#include "tools/mkdevice/ControllerBuffers.h"
#include "tools/mkdevice/Random.h"

namespace mkdevice {

using plist::Array;
using plist::Dictionary;

namespace {

// In the order of ControllerKind.
constexpr struct {
  const char *className, *propertyKey;
  bool hasMSPs, recommendsDeletion;
} kControllers[] = {
    {"NorbaQRT3NVMeController", "Controller Characteristics", true, false},
    {"NorbaEmbeddedNVMeController", "Controller Characteristics", false, false},
    {"ZMCStorage", platform::kRegistryPropertyMatchKey, false, true},
};

// In the order of ChipKind. The manufacturer's last byte is the chip's stepping.
constexpr struct {
  const char *chip, *manufacturer;
} kChips[] = {{"QM7", "2C64A1D40500"},
              {"QM8", "2C64A1D40511"},
              {"QM6", "458260DE5712"},
              {"QM6", "AD8252232110"},
              {"QM5", "2C64A1D40500"}};
static_assert(std::size(kControllers) == std::size(kControllerNames) &&
              std::size(kChips) == std::size(kChipNames));

constexpr int kHistoryHours[] = {0, 4, 8, 12, 16, 20, 24, 168, 720};

const auto& rowOf(ControllerKind kind) { return kControllers[static_cast<std::size_t>(kind)]; }

// The buffers of a controller, with the entry of its driver's dictionary that names each.
struct Buffers {
  void add(std::uint32_t opType, int argument, const std::string& name, std::string bytes) {
    const std::string file = "controller/" + name + ".bin";
    named.set(base::format("%u:%d", opType, argument), file);
    files.push_back({"device/" + file, std::move(bytes)});
  }

  Dictionary named;
  std::vector<SampleFile> files;
};

Buffers buffersOf(const Sample& sample, const Wear& wear) {
  Buffers buffers;
  buffers.add(13, 0, "statistics", ftlStatistics(wear));
  for (const int hours : kHistoryHours) {
    buffers.add(10, hours, base::format("read-statistics-%d", hours),
                ftlStatistics(Wear(sample, hours)));
  }
  for (std::uint32_t msp = 0; msp < kMSPs && rowOf(sample.controller).hasMSPs; ++msp) {
    buffers.add(221, static_cast<int>(msp), base::format("msp-%u", msp), mspStatistics(wear, msp));
  }
  buffers.add(11, 0, "band-statistics", bandStatistics(wear));
  for (const std::uint32_t list : {0u, 1u, 2u}) {
    buffers.add(17, static_cast<int>(list), base::format("telemetry-%u", list),
                telemetryList(wear, list));
  }
  buffers.add(15, 0, "defects", defectsList(wear));
  buffers.add(39, 0, "task-scheduler", unknownBuffer(wear, "task scheduler", 256));
  buffers.add(22, 0, "snapshot", unknownBuffer(wear, "snapshot", 4096));
  buffers.add(145, 0, "snapshot-header", unknownBuffer(wear, "snapshot header", 64));
  return buffers;
}

Dictionary characteristics(const Sample& sample) {
  Random random(sample.seed, "chip");
  const auto any = static_cast<ChipKind>(random.next() % std::size(kChips));
  const auto& row = kChips[static_cast<std::size_t>(sample.chip.value_or(any))];
  return {{"chip-id", row.chip},
          {"manufacturer-id", row.manufacturer},
          {"num-bus", static_cast<std::int64_t>(kChannels)},
          {"nand-device-desc", static_cast<std::int64_t>(kNANDDescription)}};
}

// Sizes of images in bytes, and how often each was updated.
Dictionary imageService(Random& random) {
  Dictionary scalars;
  for (const char* image : {"3:dBIC", "3:dLTH"}) {
    scalars.set(image, random.between(16, 96) * 4096);
  }
  for (const char* image : {"7:ifw1", "7:dBIC", "7:dLTH", "7:dCfg", "7:fCfg", "7:nefw", "7:LPEM"}) {
    scalars.set(image, random.between(0, 9));
  }
  return {{"Class", "NorbaNVMeEAN"}, {"Driver", Dictionary{{"Scalars", scalars}}}};
}

Dictionary nonVolatileMemory(Random& random) {
  return {{"Class", "NvramDiagService"},
          {"Properties", Dictionary{{"CommonUsed", random.between(1500, 3000)},
                                    {"SystemUsed", random.between(4000, 7000)},
                                    {"Generation", random.between(100, 900)},
                                    {"Version", std::int64_t{2}}}}};
}

Dictionary registry(const Sample& sample, Dictionary buffers) {
  const auto& row = rowOf(sample.controller);
  Random random(sample.seed, "registry");
  Dictionary driver;
  if (row.recommendsDeletion) driver.set("RecommendsDeletion", random.between(0, 1));
  driver.set("Buffers", std::move(buffers));
  Dictionary controller{{"Class", row.className},
                        {"Conforms", Array{"StorageController"}},
                        {"Properties", Dictionary{{row.propertyKey, characteristics(sample)}}},
                        {"Driver", std::move(driver)},
                        {"Children", Array{imageService(random)}}};
  return {
      {"Class", "Root"},
      {"Children",
       Array{Dictionary{{"Class", "PlatformBus"},
                        {"Registered", false},
                        {"Children", Array{std::move(controller), nonVolatileMemory(random)}}}}}};
}

Dictionary purgeableSpace(Random& random) {
  constexpr std::int64_t kMiB = std::int64_t{1} << 20;
  return {{"SPACEREAP_TOTAL_AVAILABLE", random.between(500, 9000) * kMiB},
          {"SPACEREAP_NONPURGEABLE_AMOUNT", random.between(30000, 60000) * kMiB}};
}

template <typename Kind>
std::optional<Kind> kindNamed(std::string_view name, std::span<const char* const> names) {
  const auto found = std::ranges::find(names, name);
  if (found == names.end()) return std::nullopt;
  return static_cast<Kind>(found - names.begin());
}

}  // namespace

std::optional<ControllerKind> controllerNamed(std::string_view name) {
  return kindNamed<ControllerKind>(name, kControllerNames);
}

std::optional<ChipKind> chipNamed(std::string_view name) {
  return kindNamed<ChipKind>(name, kChipNames);
}

std::vector<SampleFile> controllerFiles(const Sample& sample) {
  const Wear wear(sample, 0);
  Random random(sample.seed, "purgeable space");
  Buffers buffers = buffersOf(sample, wear);
  std::vector<SampleFile> files = std::move(buffers.files);
  files.push_back({"device/registry.plist", registry(sample, std::move(buffers.named))});
  files.push_back({"device/kernel-snapshot.bin", kernelSnapshot(wear)});
  files.push_back({"device/purgeable-space.plist", purgeableSpace(random)});
  return files;
}

}  // namespace mkdevice
