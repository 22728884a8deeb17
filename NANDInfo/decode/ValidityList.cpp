// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/ValidityList.h"

#include <cstdint>

#include "base/ByteReader.h"

namespace NANDInfo {

namespace {

constexpr std::uint64_t kHeaderUnit = 8, kRecordSize = 20;
constexpr std::size_t kUnreadSize = 12;  // of a record, before the list's index

}  // namespace

base::Result<ValidityLists> parseValidityList(std::span<const std::byte> buffer) {
  base::ByteReader header(buffer);
  const std::uint64_t count = header.read<std::uint32_t>().value_or(0);
  const std::uint64_t headerUnits = header.read<std::uint32_t>().value_or(UINT32_MAX);
  base::ByteReader body(buffer);
  if (count == 0 || !body.take(headerUnits * kHeaderUnit) ||
      body.rest().size() < count * kRecordSize) {
    return base::Error{"it has no records, or more than the bytes hold"};
  }

  ValidityLists lists;
  for (std::uint64_t i = 0; i < count; ++i) {
    body.take(kUnreadSize);
    const auto list = body.read<std::uint32_t>();
    const auto value = body.read<std::uint32_t>();
    if (*list < lists.size()) lists[*list].emplace_back(static_cast<std::int32_t>(*value));
  }
  return lists;
}

}  // namespace NANDInfo
