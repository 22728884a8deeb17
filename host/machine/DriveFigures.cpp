// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/machine/DriveFigures.h"

#include <algorithm>
#include <limits>

#include "base/ByteReader.h"
#include "base/ByteWriter.h"

namespace host::machine {

namespace {

constexpr std::uint64_t kMost = std::numeric_limits<std::uint64_t>::max();

constexpr char kAvailableSpare[] = "availableSpare", kSpareThreshold[] = "availableSpareThreshold";

struct Field {
  const char* name;
  std::size_t offset, width;  // in the page, in bytes
  bool zeroIsNone = false;
};

constexpr Field kHealthFields[] = {
    {"criticalWarning", 0, 1},
    {"temperature", 1, 2, true},
    {kAvailableSpare, 3, 1},
    {kSpareThreshold, 4, 1},
    {"percentageUsed", 5, 1},
    {"enduranceGroupWarning", 6, 1},
    {"dataUnitsRead", 32, 16},
    {"dataUnitsWritten", 48, 16},
    {"hostReadCommands", 64, 16},
    {"hostWriteCommands", 80, 16},
    {"controllerBusyMinutes", 96, 16},
    {"powerCycles", 112, 16},
    {"powerOnHours", 128, 16},
    {"unsafeShutdowns", 144, 16},
    {"mediaErrors", 160, 16},
    {"errorLogEntries", 176, 16},
    {"warningTemperatureMinutes", 192, 4},
    {"criticalTemperatureMinutes", 196, 4},
    {"temperatureSensor1", 200, 2, true},
    {"temperatureSensor2", 202, 2, true},
    {"temperatureSensor3", 204, 2, true},
    {"temperatureSensor4", 206, 2, true},
    {"temperatureSensor5", 208, 2, true},
    {"temperatureSensor6", 210, 2, true},
    {"temperatureSensor7", 212, 2, true},
    {"temperatureSensor8", 214, 2, true},
    {"thermalTransitions1", 216, 4},
    {"thermalTransitions2", 220, 4},
    {"thermalSeconds1", 224, 4},
    {"thermalSeconds2", 228, 4},
};

constexpr Field kSerial{"", 4, 20}, kModel{"", 24, 40}, kFirmware{"", 64, 8},
    kTotalCapacity{"", 280, 16};

// Each record of the statistics that a drive fills: its key, the figure and what one of it is.
struct Record {
  std::uint32_t key;
  const char* figure;
  std::uint64_t factor = 1;
};

constexpr std::uint64_t kSectorsOfDataUnit = 1000 * 512 / 4096;
static_assert(kSectorsOfDataUnit * 4096 == 1000 * 512);

constexpr Record kRecords[] = {
    {2, "hostWriteCommands"},                     // hostWriteXacts
    {3, "hostReadCommands"},                      // hostReadXacts
    {4, "dataUnitsWritten", kSectorsOfDataUnit},  // hostWrites
    {7, "dataUnitsRead", kSectorsOfDataUnit},     // hostReads
    {10, "powerCycles"},                          // boots
    {11, "unsafeShutdowns"},                      // uncleanBoots
    {34, "powerOnHours"},                         // powerOnHours
    {36, "criticalWarning"},                      // smartCritWarnings
    {414, "mediaErrors"},                         // ueccReads
    {431, "percentageUsed"},                      // percentUsed
    {532, kAvailableSpare},                       // spareAvailablePercent
};
static_assert(std::ranges::adjacent_find(kRecords, std::ranges::greater_equal{}, &Record::key) ==
              std::end(kRecords));

std::uint64_t valueOf(std::span<const std::byte> page, const Field& field) {
  const auto bytes = page.subspan(field.offset, field.width);
  const auto low = bytes.first(std::min(bytes.size(), sizeof(std::uint64_t)));
  const auto high = bytes.subspan(low.size());
  return base::littleEndianOfAnyWidth(high) != 0 ? kMost : base::littleEndianOfAnyWidth(low);
}

// Texts are filled up with blanks, by some drives with zeros.
std::string textOf(std::span<const std::byte> page, const Field& field) {
  constexpr std::string_view kBlanks(" \0", 2);
  const auto bytes = page.subspan(field.offset, field.width);
  std::string_view text(reinterpret_cast<const char*>(bytes.data()), bytes.size());
  text.remove_prefix(std::min(text.find_first_not_of(kBlanks), text.size()));
  return std::string(text.substr(0, text.find_last_not_of(kBlanks) + 1));
}

// A drive with neither a spare nor a threshold for it doesn't count it.
bool tellsSpare(const DriveFigures& figures) {
  return figureNamed(figures, kAvailableSpare).value_or(0) != 0 ||
         figureNamed(figures, kSpareThreshold).value_or(0) != 0;
}

constexpr std::uint64_t kLastLifeTime = 11, kLastEndOfLife = 3;

}  // namespace

std::optional<std::uint64_t> figureNamed(const DriveFigures& figures, std::string_view name) {
  const auto found = std::ranges::find(figures, name, &DriveFigure::name);
  return found != figures.end() ? std::optional(found->value) : std::nullopt;
}

DriveFigures figuresOf(HealthLog page) {
  DriveFigures figures;
  for (const Field& field : kHealthFields) {
    const std::uint64_t value = valueOf(page, field);
    if (value != 0 || !field.zeroIsNone) figures.push_back({field.name, value});
  }
  return figures;
}

DriveIdentity identityOf(IdentifyPage page) {
  return {.model = textOf(page, kModel),
          .serial = textOf(page, kSerial),
          .firmware = textOf(page, kFirmware),
          .capacity = valueOf(page, kTotalCapacity)};
}

DriveFigures figuresOfLifeTime(std::optional<std::uint64_t> lifeTimeA,
                               std::optional<std::uint64_t> lifeTimeB,
                               std::optional<std::uint64_t> endOfLife) {
  DriveFigures figures;
  std::uint64_t most = 0;
  const auto add = [&figures](const char* name, std::optional<std::uint64_t> value,
                              std::uint64_t last) {
    if (!value || *value == 0 || *value > last) return std::uint64_t{0};
    figures.push_back({name, *value});
    return *value;
  };
  most = std::max(most, add("lifeTimeA", lifeTimeA, kLastLifeTime));
  most = std::max(most, add("lifeTimeB", lifeTimeB, kLastLifeTime));
  add("endOfLife", endOfLife, kLastEndOfLife);
  if (most > 0) figures.push_back({"percentageUsed", (most - 1) * 10});
  return figures;
}

std::vector<std::uint8_t> statisticsOf(const DriveFigures& figures) {
  std::vector<std::uint8_t> buffer;
  for (const auto& [key, name, factor] : kRecords) {
    const auto figure = figureNamed(figures, name);
    if (!figure || (std::string_view(name) == kAvailableSpare && !tellsSpare(figures))) continue;
    base::appendLittleEndian(buffer, key);
    base::appendLittleEndian(buffer, std::uint32_t{1});
    base::appendLittleEndian(buffer, *figure > kMost / factor ? kMost : *figure * factor);
  }
  return buffer;
}

}  // namespace host::machine
