// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// One line of an import: a JSON object that sets, adds to or pushes to a counter.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "base/Result.h"
#include "host/counters/CounterStore.h"

namespace pelloran {

// The day and the second within it that hold where a line names none.
struct Moment {
  std::int32_t day;
  std::int32_t second;
};
Moment momentOf(plist::Date now);

struct ImportLine {
  std::string key;
  host::CounterChange change;  // its key is left empty
};

// Parses {"set"|"add"|"push": key, "value": number, "day": D, "seconds": S}; the last two may be
// missing. Pure; anything else is an error that says what it stumbled over.
base::Result<ImportLine> parseImportLine(std::string_view line, Moment now);

}  // namespace pelloran
