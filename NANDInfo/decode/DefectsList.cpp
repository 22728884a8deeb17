// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/DefectsList.h"

#include <algorithm>
#include <array>

#include "base/ByteReader.h"

namespace NANDInfo {

base::Result<DefectsList> DefectsList::parse(std::span<const std::byte> buffer) {
  base::ByteReader reader(buffer);
  reader.read<std::uint32_t>();
  const auto factoryCount = reader.read<std::uint32_t>();
  const auto count = reader.read<std::uint32_t>();
  if (!count) return base::Error{"it is shorter than the list's header"};
  const std::size_t fitting = std::min<std::size_t>(*count, reader.rest().size() / kRecordSize);
  return DefectsList(*factoryCount, reader.rest().first(fitting * kRecordSize));
}

Defect DefectsList::operator[](std::size_t place) const {
  base::ByteReader reader(records_.subspan(place * kRecordSize, kRecordSize));
  std::array<std::uint32_t, kRecordSize / sizeof(std::uint32_t)> words;
  for (std::uint32_t& word : words) word = reader.read<std::uint32_t>().value_or(0);
  return {.bus = static_cast<std::uint16_t>(words[0]),
          .CE = static_cast<std::uint16_t>(words[0] >> 16),
          .CAU = words[1],
          .block = words[2],
          .cycle = words[3],
          .reason = words[4],
          .page = words[5],
          .temperature = static_cast<std::int8_t>(words[6] & 0xFF),
          .mode = words[7]};
}

std::optional<std::uint32_t> reasonOffset(std::uint32_t mode) {
  constexpr std::uint32_t kOffsets[] = {0, 200, 100};
  return mode < std::size(kOffsets) ? std::optional(kOffsets[mode]) : std::nullopt;
}

plist::Dictionary defectLog(const Defect& defect) {
  const auto number = [](std::uint32_t word) { return static_cast<std::int32_t>(word); };
  return {{"Bus", number(defect.bus)},     {"CE", number(defect.CE)},
          {"CAU", number(defect.CAU)},     {"Block", number(defect.block)},
          {"Cycle", number(defect.cycle)}, {"Reason", number(defect.reason)},
          {"Page", number(defect.page)},   {"Temperature", std::int32_t{defect.temperature}}};
}

}  // namespace NANDInfo
