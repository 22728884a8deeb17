// Property lists as bytes.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

#include "base/Result.h"
#include "plist/Value.h"

namespace plist {

// Longer property lists are refused.
inline constexpr std::size_t kMaxSize = std::size_t{16} << 20;

// Reads either encoding: what begins with "bplist" is binary, everything else XML. The error names
// the place: a line or an offset. Integers become int64, or uint64 where they are larger; reals of
// four bytes float, others double.
base::Result<Value> read(std::string_view bytes);

// Writes XML, version 1.0. What can't stand in XML (characters that it forbids, text that is not
// UTF-8) becomes U+FFFD; dates are in whole seconds. Fails on nesting deeper than kMaxDepth. `read`
// reads an equal value from it.
base::Result<std::string> writeXML(const Value& value);

}  // namespace plist
