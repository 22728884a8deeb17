// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Bytes as the record of a drive, and the figures in it.
#include <cstddef>
#include <cstdint>
#include <string>

#include "PropertyListRoundTrip.h"
#include "host/machine/DriveFigures.h"
#include "host/machine/DriveRecord.h"

using namespace host::machine;

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  const auto record = readDriveRecord({reinterpret_cast<const char*>(bytes), size});
  if (!record) return 0;
  const auto again = bytesOf(*record).and_then(
      [](const std::string& written) { return readDriveRecord(written); });
  fuzz::require(again && again->healthLog == record->healthLog &&
                    again->identify == record->identify &&
                    again->moment.sinceBoot == record->moment.sinceBoot,
                "what is written is what was read");
  const DriveIdentity identity = identityOf(IdentifyPage(record->identify));
  fuzz::require(identity.model.size() <= 40 && identity.serial.size() <= 20, "texts are bounded");
  const auto statistics = statisticsOf(figuresOf(HealthLog(record->healthLog)));
  constexpr std::size_t kRecords = 11, kRecordSize = 16;
  fuzz::require(statistics.size() == kRecords * kRecordSize, "every record is there");
  return 0;
}
