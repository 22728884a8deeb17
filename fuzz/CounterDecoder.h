// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What holds of every decoder of counter buffers, whatever the bytes.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory_resource>
#include <span>
#include <string>
#include <tuple>
#include <utility>
#include <vector>

#include "Input.h"
#include "NANDInfo/GenericParserContext.h"

namespace fuzz {

using Fields = std::vector<std::pair<std::string, std::uint64_t>>;

inline void require(bool condition) { require(condition, "decoders keep their promise"); }

inline Fields fieldsOf(const NANDInfo::GenericParserCxt& context) {
  Fields fields;
  for (std::size_t i = 0; i < context.size(); ++i) {
    require(context[i].name.size() <= NANDInfo::kMaxFieldName);
    fields.emplace_back(context[i].name, context[i].value);
  }
  return fields;
}

inline bool isSubsequence(const Fields& some, const Fields& all) {
  auto place = all.begin();
  for (const auto& field : some) {
    while (place != all.end() && *place != field) ++place;
    if (place++ == all.end()) return false;
  }
  return true;
}

// Decodes twice, and once more with little memory, and returns the fields. Elements are at least
// `narrowest` bytes wide.
template <typename Decode>
Fields checkDecoder(Decode decode, std::span<const std::byte> bytes, std::size_t narrowest) {
  const auto run = [&](std::pmr::memory_resource* memory) {
    NANDInfo::GenericParserCxt context(memory);
    const NANDInfo::Decoded decoded = decode(bytes, &context);
    return std::tuple(decoded.values, fieldsOf(context), decoded.complaint);
  };
  const auto [total, fields, message] = run(std::pmr::new_delete_resource());
  require(fields.size() <= bytes.size() / narrowest);
  // The two differ only by what is dropped from an array of more than 65,535 elements.
  require(total == fields.size() || (total > fields.size() && bytes.size() > 65535 * narrowest));
  require(run(std::pmr::new_delete_resource()) == std::tuple(total, fields, message));

  std::vector<std::byte> room(bytes.size());
  std::pmr::monotonic_buffer_resource little(room.data(), room.size(),
                                             std::pmr::null_memory_resource());
  const auto [lessTotal, fewer, noMemory] = run(&little);
  require(lessTotal <= total && isSubsequence(fewer, fields));
  return fields;
}

}  // namespace fuzz
