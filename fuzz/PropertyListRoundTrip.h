// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What must hold for every property list that could be read.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>

#include "Input.h"
#include "plist/JSON.h"
#include "plist/PropertyList.h"
#include "plist/Value.h"
#include "plist/XMLReader.h"

namespace fuzz {

// Reads with one of the readers; a value must write, and read back as one that is the same in both
// of the forms that are written.
template <typename Read>
void checkRoundTrip(Read read, const std::uint8_t* bytes, std::size_t size) {
  const auto value = read({reinterpret_cast<const char*>(bytes), size});
  if (!value) return require(!value.error().text.empty(), "a failure says why");
  const auto text = plist::writeXML(*value);
  require(bool(text), "what was read can be written");
  const auto again = plist::readXML(*text);
  require(bool(again), "what was written can be read");
  require(*plist::writeXML(*again) == *text, "what was written reads as what writes the same");
  std::string before, after;
  plist::appendJSON(before, *value);
  plist::appendJSON(after, *again);
  require(before == after, "and as the same value in JSON");
}

}  // namespace fuzz
