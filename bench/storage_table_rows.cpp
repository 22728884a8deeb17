// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The storage library's tables: expanded once, then asked for every counter.
#include <cstring>
#include <string>
#include <unordered_map>
#include <vector>

#include "NANDInfo/KeyMap.h"
#include "NANDInfo/KeyTables.h"
#include "NANDInfo/NameTable.h"
#include "NANDInfo/Whitelists.h"
#include "bench/Rows.h"

namespace bench {

namespace {

using plist::Dictionary;

// The key map as a plain table.
struct Record {
  char counter[104];
  std::string key;
};

std::vector<Record> keyMapRecords() {
  std::vector<Record> records;
  for (const auto& [counter, key] : NANDInfo::keyMapEntries()) {
    Record& record = records.emplace_back(Record{{}, std::string(key)});
    counter.copy(record.counter, sizeof record.counter - 1);
  }
  return records;
}

// Everything that the controller's key table names.
Dictionary ftlDictionary() {
  Dictionary counters;
  std::uint64_t value = 1;
  for (const NANDInfo::FTLKey& row : NANDInfo::FTLKeyTable()) {
    for (unsigned i = 0; i < row.elements; ++i) {
      const std::string suffix = row.elements == 1 ? "" : "_" + std::to_string(i);
      counters.set(row.name + suffix, value = value * 6364136223846793005u + 1);
    }
  }
  return counters;
}

}  // namespace

void addStorageTableRows(Table& table) {
  // Without storing what is found, which costs the same either way.
  const auto records = keyMapRecords();
  std::vector<std::string> names;
  for (const Record& record : records) names.emplace_back(record.counter);
  table.compare(
      "renaming a legacy counter through the key map", "a linear walk of the table", 0.1,
      static_cast<double>(names.size()),
      [&] {
        for (const std::string& name : names) keep(NANDInfo::keyMapKey(name));
      },
      [&] {
        for (const std::string& name : names) {
          for (const auto& [counter, key] : records) {
            if (std::strncmp(counter, name.c_str(), 100) != 0) continue;
            keep(key.data());
            break;
          }
        }
      },
      51);

  const Dictionary counters = ftlDictionary();
  const NANDInfo::NameTable& whitelist = NANDInfo::WhitelistedRawNANDFTLCounters_SigDigDict();
  table.compare(
      "filtering and rounding a copy of the FTL dictionary", "copying its entries into a new one",
      1.5, 1, [&] { keep(NANDInfo::CreateFilteredDict_SigDig(counters, &whitelist, true)); },
      [&] {
        Dictionary copy;
        for (const auto& [key, value] : counters) copy.set(key, value);
        keep(copy);
      },
      51);

  std::vector<std::string> whitelisted;
  for (const auto& [name, digits] : whitelist) whitelisted.emplace_back(name);
  std::vector<NANDInfo::NameRow> rows;
  for (const std::string& name : whitelisted) rows.push_back({name.c_str(), 8});
  table.compare(
      "a table of the FTL whitelist's names", "a hash table of them", 1.0, 1,
      [&] { keep(NANDInfo::NameTable(rows)); },
      [&] {
        std::unordered_map<std::string, std::uint8_t> hashed(whitelist.size());
        for (const auto& [name, digits] : whitelist) hashed.emplace(name, digits);
        keep(hashed);
      },
      51);
}

}  // namespace bench
