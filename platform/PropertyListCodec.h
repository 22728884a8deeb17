// Property lists as bytes.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

#include "platform/PropertyList.h"
#include "platform/Result.h"

namespace platform {

// Longer property lists are refused.
inline constexpr std::size_t kMaximumPropertyListSize = std::size_t{16} << 20;

class PropertyListCodec {
 public:
  virtual ~PropertyListCodec() = default;

  // Reads either encoding, XML or binary. The error names the place: a line or an offset. Integers
  // become int64, or uint64 where they are larger; reals of four bytes float, others double.
  virtual Result<Value> read(std::string_view bytes) = 0;

  // Writes XML, version 1.0. What can't stand in XML (characters that it forbids, text that is not
  // UTF-8) becomes U+FFFD. Fails on nesting deeper than kMaximumPropertyListDepth.
  virtual Result<std::string> writeXML(const Value& value) = 0;
};

}  // namespace platform
