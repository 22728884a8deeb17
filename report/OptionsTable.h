// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Keys, or key prefixes, each with its options: one section of the whitelist.
#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "base/KeyIndex.h"
#include "report/CounterOptions.h"

namespace report {

class OptionsTable {
 public:
  struct Entry {
    std::string key;
    CounterOptions options;
  };

  // Adds an entry, or replaces that of the key.
  void set(const std::string& key, CounterOptions options);

  // The options of exactly this key, or null; borrowed until the next change.
  const CounterOptions* find(std::string_view key) const;

  const std::vector<Entry>& entries() const { return entries_; }

 private:
  std::uint32_t place(std::string_view key, std::uint32_t hash) const;

  std::vector<Entry> entries_;
  base::KeyIndex index_;
};

}  // namespace report
