// What must hold for every property list that could be read.
#pragma once

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <string>

#include "platform/PropertyList.h"
#include "platform/host/JSON.h"
#include "platform/host/PropertyListXMLReader.h"
#include "platform/host/PropertyListXMLWriter.h"

namespace fuzz {

inline void require(bool holds, const char* what) {
  if (holds) return;
  std::fprintf(stderr, "%s\n", what);
  std::abort();
}

// Reads with one of the readers; a value must write, and read back as one that is the same in both
// of the forms that are written.
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
  require(*writeXMLPropertyList(*again) == *text, "what was written reads as what writes the same");
  std::string before, after;
  appendJSON(before, *value);
  appendJSON(after, *again);
  require(before == after, "and as the same value in JSON");
}

}  // namespace fuzz
