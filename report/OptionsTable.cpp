// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "report/OptionsTable.h"

#include <cstdint>
#include <utility>

namespace report {

using base::KeyIndex;

std::uint32_t OptionsTable::place(std::string_view key, std::uint32_t hash) const {
  return index_.find(hash, [&](std::uint32_t entry) { return entries_[entry].key == key; });
}

void OptionsTable::set(const std::string& key, CounterOptions options) {
  const std::uint32_t hash = base::keyHash(key);
  const std::uint32_t found = place(key, hash);
  if (found != KeyIndex::kNone) {
    entries_[found].options = std::move(options);
  } else {
    index_.insert(hash, static_cast<std::uint32_t>(entries_.size()));
    entries_.push_back({key, std::move(options)});
  }
}

const CounterOptions* OptionsTable::find(std::string_view key) const {
  const std::uint32_t found = place(key, base::keyHash(key));
  return found != KeyIndex::kNone ? &entries_[found].options : nullptr;
}

}  // namespace report
