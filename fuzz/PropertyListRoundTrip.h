// What must hold for every property list that could be read.
#pragma once

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <string>

#include "platform/PropertyList.h"
#include "platform/host/JSON.h"
#include "platform/host/PropertyListXMLReader.h"
#include "platform/host/PropertyListXMLWriter.h"

namespace fuzz {

// The value that is to come back: dates in whole seconds; not-a-number, which equals nothing, as a
// text.
inline platform::Value asWritten(const platform::Value& value) {
  if (const auto* date = value.as<platform::Date>()) {
    return platform::Date{std::clamp(std::floor(date->secondsSince1970), -1e14, 1e14)};
  }
  if (const auto* array = value.as<platform::Array>()) {
    platform::Array out;
    for (const platform::Value& element : *array) out.push_back(asWritten(element));
    return out;
  }
  if (const auto* dictionary = value.as<platform::Dictionary>()) {
    platform::Dictionary out;
    for (const auto& entry : *dictionary) out.set(entry.key, asWritten(entry.value));
    return out;
  }
  const auto* number = value.as<platform::Number>();
  const bool isNaN = number != nullptr && number->isReal() && std::isnan(number->doubleValue());
  return isNaN ? platform::Value("nan") : value;
}

inline void require(bool holds, const char* what) {
  if (holds) return;
  std::fprintf(stderr, "%s\n", what);
  std::abort();
}

// Reads with one of the readers; a value must write, and read back as an equal one.
template <typename Read>
void checkRoundTrip(Read read, const std::uint8_t* bytes, std::size_t size) {
  using namespace platform::host;
  const auto value = read({reinterpret_cast<const char*>(bytes), size});
  require(value.value.has_value() == value.error.empty(), "an error is a failure's, and only its");
  if (!value) return;
  const auto text = writeXMLPropertyList(*value);
  require(text.value.has_value(), "what was read can be written");
  const auto again = readXMLPropertyList(*text);
  require(again.value.has_value(), "what was written can be read");
  const platform::Value expected = asWritten(*value), found = asWritten(*again);
  require(found == expected, "what was written reads as the same value");
  require(*writeXMLPropertyList(found) == *writeXMLPropertyList(expected), "with the same types");
  std::string json;
  appendJSON(json, *value);
}

}  // namespace fuzz
