#include "NANDInfo/ValidityList.h"

#include <cstdint>

#include "NANDInfo/ByteReader.h"

namespace NANDInfo {

namespace {

constexpr std::uint64_t kHeaderUnit = 8, kRecordSize = 20;
constexpr std::size_t kListOffset = 12, kValueOffset = 16;

}  // namespace

std::optional<ValidityLists> parseValidityList(std::span<const std::byte> buffer) {
  ByteReader header(buffer);
  const std::uint64_t count = header.read<std::uint32_t>().value_or(0);
  const std::uint64_t headerUnits = header.read<std::uint32_t>().value_or(UINT32_MAX);
  ByteReader body(buffer);
  if (count == 0 || !body.take(headerUnits * kHeaderUnit)) return std::nullopt;
  const auto records = body.take(count * kRecordSize);
  if (!records) return std::nullopt;

  ValidityLists lists;
  for (std::size_t at = 0; at < records->size(); at += kRecordSize) {
    const auto list = std::to_integer<std::size_t>((*records)[at + kListOffset]);
    if (list >= lists.size()) continue;
    lists[list].emplace_back(std::to_integer<std::int32_t>((*records)[at + kValueOffset]));
  }
  return lists;
}

}  // namespace NANDInfo
