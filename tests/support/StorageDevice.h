// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// A device in memory with a storage controller whose buffers a test names field by field.
#pragma once

#include <gtest/gtest.h>

#include <algorithm>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "NANDInfo/KeyTables.h"
#include "NANDInfo/NANDInfo.h"
#include "NANDInfo/interface/Exporters.h"
#include "support/ControllerBuffers.h"
#include "support/FreshErrors.h"
#include "support/TestPlatform.h"

namespace support {

// Arrays by their names in the key table, with the values of their first elements.
using FTLFields = std::vector<std::pair<std::string_view, std::vector<std::uint64_t>>>;

inline Bytes ftlBuffer(const FTLFields& fields) {
  std::vector<std::uint64_t> all;
  for (const auto& [name, values] : fields) {
    const auto table = NANDInfo::FTLKeyTable();
    const auto row =
        std::find_if(table.begin(), table.end(),
                     [wanted = name](const NANDInfo::FTLKey& key) { return wanted == key.name; });
    all.push_back(header(row->key, static_cast<std::uint32_t>(values.size())));
    all.insert(all.end(), values.begin(), values.end());
  }
  return words(all);
}

struct StorageDevice : TestPlatform {
  explicit StorageDevice(const char* controller = nullptr) {
    NANDInfo::ResetExporters();
    support::freshErrors();
    if (controller != nullptr) registry.add({.className = controller});
  }

  // No handle is left open by any exchange, and no call was one that the test doesn't know of.
  ~StorageDevice() { EXPECT_EQ(registry.problems(), std::vector<std::string>()); }

  // What the controller answers whenever it is asked for its statistics.
  void setStatistics(const FTLFields& fields) { setBuffer(13, 0, fields); }

  // The snapshot of its magazine so many hours back.
  void setSnapshot(std::uint32_t hours, const FTLFields& fields) { setBuffer(10, hours, fields); }

 private:
  void setBuffer(std::uint32_t opType, std::uint32_t argument, const FTLFields& fields) {
    for (const std::uint32_t method : {8U, 9U}) {
      registry.alwaysTunnels(method, opType, argument, ftlBuffer(fields));
    }
  }
};

inline constexpr char kQRT3[] = "NorbaQRT3NVMeController";
inline constexpr char kEmbedded[] = "NorbaEmbeddedNVMeController";
inline constexpr char kZMCStorage[] = "ZMCStorage";

}  // namespace support
