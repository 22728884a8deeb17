// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/mkdevice/SampleDay.h"

#include "base/ByteWriter.h"
#include "base/CivilDate.h"
#include "base/Text.h"
#include "base/Timestamp.h"
#include "tools/mkdevice/BufferWriter.h"
#include "tools/mkdevice/Random.h"
#include "tools/mkdevice/SampleController.h"
#include "tools/mkdevice/SampleUsage.h"
#include "tools/mkdevice/Wear.h"

namespace mkdevice {

using plist::Array;
using plist::Data;
using plist::Dictionary;

namespace {

constexpr std::int64_t kGiB = std::int64_t{1} << 30;
constexpr std::int64_t kPageSize = 16384, kBlockSize = 4096;

Dictionary properties(const Sample& sample) {
  Random random(sample.seed, "properties"), ofDay(sample.seed, "disk", sample.today);
  const std::int64_t free = random.between(20 * kGiB, 60 * kGiB) + ofDay.between(-kGiB, kGiB);
  return {{"InternalBuild", false},
          {"HardwareModel", "Vrn12,3"},
          {"SystemIdentifier", random.hexadecimal(40)},
          {"InverseDeviceID", random.hexadecimal(32)},
          {"DiskUsage", Dictionary{{"TotalDiskCapacity", 119 * kGiB},
                                   {"TotalDataAvailable", free + 4 * kGiB},
                                   {"AmountDataAvailable", free}}},
          {"FileSystem", Dictionary{{"BlockSize", kBlockSize},
                                    {"Blocks", 119 * kGiB / kBlockSize},
                                    {"BlocksAvailable", free / kBlockSize}}}};
}

std::string bootSession(const Wear& wear) {
  Random random(wear.seed, "boot", static_cast<std::int64_t>(wear.boot()));
  const auto bits = [&random](int count) {
    return static_cast<unsigned>(random.next() >> (64 - count));
  };
  return base::format("%08X-%04X-4%03X-A%03X-%04X%08X", bits(32), bits(16), bits(12), bits(12),
                      bits(16), bits(32));
}

// Total, available and used bytes, the page size, and whether the swap is encrypted.
Data swapUsage(Random& random) {
  const auto total = static_cast<std::uint64_t>(random.between(1, 4) * kGiB);
  const std::uint64_t used = total / 16 * (random.next() % 16);
  Data record;
  for (const std::uint64_t bytes : {total, total - used, used}) {
    base::appendLittleEndian(record, bytes);
  }
  base::appendLittleEndian(record, static_cast<std::uint32_t>(kPageSize));
  base::appendLittleEndian(record, std::uint32_t{1});
  return record;
}

// The kernel's counters agree with each other: parts add up, nothing is thawed that wasn't frozen.
Dictionary kernelValues(const Sample& sample, const Wear& wear) {
  Random random(sample.seed, "kernel");
  Dictionary values{{"hw.pagesize", kPageSize},
                    {"vm.swapusage", swapUsage(random)},
                    {"kern.bootsessionuuid", bootSession(wear)}};
  std::int64_t total = 0;
  for (const char* size : {"1", "2", "4", "8", "16", "32", "64", "128", "256"}) {
    const std::int64_t found = random.between(0, 3);
    total += found;
    values.set(base::format("vm.vmtc_%s_byte", size), found);
  }
  const std::int64_t bitFlips = random.between(0, 2), undiagnosed = random.between(1, 3);
  values.set("vm.vmtc_one_bit_flip", bitFlips);
  values.set("vm.vmtc_not_found", random.between(0, 2));
  values.set("vm.vmtc_undiagnosed", undiagnosed);
  values.set("vm.vmtc_total", total + bitFlips + undiagnosed);

  const std::int64_t considered = random.between(900, 2400), frozen = random.between(120, 260);
  const std::int64_t thawed = frozen * random.between(30, 60) / 100;
  const std::int64_t refrozen = random.between(20, thawed);
  const struct {
    const char* name;
    std::int64_t value;
  } freezer[] = {
      {"freeze_count", frozen},
      {"freeze_pageouts", frozen * random.between(2000, 4000)},
      {"freeze_budget_pages_remaining", random.between(20000, 90000)},
      {"thaw_count", thawed},
      {"thaw_count_since_boot", thawed * 3},
      {"freezer_thaw_percentage", thawed * 100 / frozen},
      {"freezer_process_considered_count", considered},
      {"freezer_error_no_compressor_space_count", considered * random.between(0, 4) / 100},
      {"freezer_error_no_swap_space_count", considered * random.between(0, 6) / 100},
      {"freezer_error_below_min_pages_count", considered * random.between(10, 30) / 100},
      {"freezer_error_low_probability_of_use_count", considered * random.between(20, 40) / 100},
      {"freezer_error_other_count", considered * random.between(0, 5) / 100},
      {"freezer_below_threshold_count", random.between(100, 400)},
      {"freezer_skipped_full_count", random.between(0, 60)},
      {"freezer_refreeze_count", refrozen},
      {"freezer_bytes_refrozen", refrozen * random.between(8, 40) * kPageSize * 64},
  };
  for (const auto& [name, value] : freezer) {
    values.set(base::format("kern.memorystatus_%s", name), value);
  }
  return values;
}

// What the kernel's drivers count. Only simple channels of the first category are reported.
Array reportChannels(const Wear& wear) {
  constexpr std::int64_t kReported = 0x100, kOther = 0x2;
  constexpr std::int64_t kSimple = 1, kState = 2, kHistogram = 3;
  constexpr struct {
    const char* name;
    std::int64_t category, format;
    double perDay;
  } kChannels[] = {
      {"storage.commands_timed_out", kReported, kSimple, 0.2},
      {"storage.controller_resets", kReported, kSimple, 0.01},
      {"storage.queue_depth", kReported, kHistogram, 9000},
      {"display.frames_missed", kReported | kOther, kSimple, 410},
      {"display.power_state", kReported, kState, 70},
      {"power.wakes", kReported, kSimple, 96},
      {"power.rail_energy_mj", kOther, kSimple, 31000},
      {"thermal.throttled_seconds", kReported, kSimple, 14},
  };
  Array channels;
  for (const auto& [name, category, format, perDay] : kChannels) {
    channels.push_back(Dictionary{{"Name", name},
                                  {"Category", category},
                                  {"Format", format},
                                  {"Value", wear.sinceFormat(perDay)}});
  }
  return channels;
}

// The memory errors that have come in since the day before: mostly none, sometimes more than one
// run reports.
std::vector<SampleFile> memoryErrors(const Sample& sample) {
  constexpr int kEntries = 8;
  Random random(sample.seed, "memory errors", sample.today);
  const double luck = random.fraction();
  const auto count = luck < 0.45 ? 0 : luck < 0.75 ? random.between(1, 3) : random.between(11, 15);
  std::vector<SampleFile> files;
  for (std::int64_t i = 0; i < count; ++i) {
    const std::int64_t used = random.between(1, kEntries);
    BufferWriter record;
    record.number(random.next() % 6, 1);  // the source
    record.number(static_cast<std::uint64_t>(used), 1);
    record.zeros(6);
    for (int entry = 0; entry < kEntries; ++entry) {
      record.number(entry < used ? random.next() >> 24 : 0, 8);
    }
    files.push_back({base::format("device/ecc-events/%05d-%02d.bin", static_cast<int>(sample.today),
                                  static_cast<int>(i)),
                     record.bytes()});
  }
  return files;
}

std::string supportLog(const Sample& sample, const char* name, std::int32_t day) {
  Random random(sample.seed, name, day);
  std::string lines;
  for (int i = 0; i < 4; ++i) {
    const double second = static_cast<double>(day) * static_cast<double>(base::kSecondsPerDay) +
                          i * 21600 + static_cast<double>(random.between(0, 21599));
    base::appendTimestamp(lines, second);
    lines += base::format(" session %04d: %d requests answered\n", i + 1,
                          static_cast<int>(random.between(2, 60)));
  }
  return lines;
}

}  // namespace

std::vector<SampleFile> filesOfDay(const Sample& sample) {
  const Wear wear(sample, 0);
  const std::int32_t yesterday = sample.today - 1;
  std::vector<SampleFile> files = {
      {"device/properties.plist", properties(sample)},
      {"device/kernel.plist", kernelValues(sample, wear)},
      {"device/report-channels.plist", reportChannels(wear)},
      {"device/network-usage.plist", networkUsage(sample)},
      {"var/log/servita/support.log", supportLog(sample, "support", yesterday)},
      // As yesterday's run left it.
      {"var/log/servita/support.log.1", supportLog(sample, "support", yesterday - 1)},
      {"var/log/servita/uploads.log", supportLog(sample, "uploads", yesterday)},
  };
  for (SampleFile& file : memoryErrors(sample)) files.push_back(std::move(file));
  for (SampleFile& file : controllerFiles(sample)) files.push_back(std::move(file));
  return files;
}

}  // namespace mkdevice
