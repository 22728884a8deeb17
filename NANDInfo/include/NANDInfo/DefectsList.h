// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The defects list: the number of defects from the factory, and a record of every defect since.
//
// Little-endian words: one that isn't read, the factory's count, the number of records; then the
// records of 32 bytes.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>

#include "base/Exported.h"
#include "base/Result.h"
#include "plist/Value.h"

namespace MORVEND_EXPORTED NANDInfo {

// Where a block went bad, and why: bus, chip enable and unit of the chip, the block in it and the
// page; the block's cycles, and the temperature in degrees Celsius.
struct Defect {
  std::uint16_t bus, CE;
  std::uint32_t CAU, block, cycle, reason, page;
  std::int8_t temperature;
  std::uint32_t mode;
};

class DefectsList {
 public:
  static constexpr std::size_t kHeaderSize = 12, kRecordSize = 32;

  // Borrows the buffer; fails when it is shorter than the header. Records that don't lie wholly
  // within it are cut off.
  static base::Result<DefectsList> parse(std::span<const std::byte> buffer);

  std::uint32_t factoryCount() const { return factoryCount_; }
  std::size_t size() const { return records_.size() / kRecordSize; }
  Defect operator[](std::size_t place) const;

 private:
  DefectsList(std::uint32_t factoryCount, std::span<const std::byte> records)
      : factoryCount_(factoryCount), records_(records) {}

  std::uint32_t factoryCount_;
  std::span<const std::byte> records_;
};

// What a defect mode adds to the reason; none for a mode that isn't known.
std::optional<std::uint32_t> reasonOffset(std::uint32_t mode);

// The defect as the structured log holds it, each figure under its name.
plist::Dictionary defectLog(const Defect& defect);

}  // namespace NANDInfo
