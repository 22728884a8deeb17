// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// A device root with a controller that answers: every counter that has a name, three MSPs, lists,
// EAN images; and with a disk whose figures stay the same.
#pragma once

#include <string_view>

#include "NANDInfo/KeyTables.h"
#include "plist/PropertyList.h"
#include "support/ControllerBuffers.h"
#include "support/TemporaryFolder.h"

namespace support {

inline plist::Data data(const Bytes& bytes) {
  const auto* begin = reinterpret_cast<const std::uint8_t*>(bytes.data());
  return {begin, begin + bytes.size()};
}

// Each record's values count up from its key.
inline Bytes everyFTLCounter() {
  std::vector<std::uint64_t> all;
  for (const NANDInfo::FTLKey& key : NANDInfo::FTLKeyTable()) {
    all.push_back(header(key.key, key.elements));
    for (std::uint64_t i = 0; i < key.elements; ++i) all.push_back(key.key * 1000u + i);
  }
  return words(all);
}

inline Bytes everyMSPCounter(std::uint64_t first) {
  std::vector<MSPRecord> all;
  for (const NANDInfo::MSPTag& tag : NANDInfo::MSPTagTable()) {
    MSPRecord record{tag.tag, tag.width, {}, std::uint64_t{tag.width} * tag.elements};
    for (std::uint64_t i = 0; i < tag.elements; ++i) record.values.push_back(first + tag.tag + i);
    all.push_back(std::move(record));
  }
  return records(all);
}

inline void writeController(const TemporaryFolder& root) {
  using plist::Array;
  using plist::Dictionary;
  const auto text = [](const Bytes& bytes) {
    return std::string_view(reinterpret_cast<const char*>(bytes.data()), bytes.size());
  };
  root.write("device/statistics", text(everyFTLCounter()));
  const Dictionary buffers{{"13", "statistics"},
                           {"10:24", data(words({header(4, 1), 24}))},
                           {"221:0", data(everyMSPCounter(0))},
                           {"221:1", data(everyMSPCounter(1000000))},
                           {"221:2", data(everyMSPCounter(2000000))},
                           {"15", plist::Data()},
                           {"17:1", plist::Data(5000, 17)}};
  const Dictionary controller{
      {"Class", "NorbaQRT3NVMeController"},
      {"Properties", Dictionary{{"Controller Characteristics", Dictionary{{"chip-id", "A1"}}}}},
      {"Driver", Dictionary{{"Buffers", buffers}}}};
  const Dictionary images{
      {"Class", "NorbaNVMeEAN"},
      {"Driver",
       Dictionary{{"Scalars", Dictionary{{"3:dBIC", 4096}, {"7:ifw1", std::uint64_t{1} << 63}}}}}};
  const Dictionary disk{{"TotalDiskCapacity", std::int64_t{128} << 30},
                        {"TotalDataAvailable", std::int64_t{32} << 30},
                        {"AmountDataAvailable", std::int64_t{16} << 30}};
  root.write("device/registry.plist",
             *plist::writeXML(Dictionary{{"Children", Array{controller, images}}}));
  root.write("device/properties.plist", *plist::writeXML(Dictionary{{"DiskUsage", disk}}));
}

}  // namespace support
