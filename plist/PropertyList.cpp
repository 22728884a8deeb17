// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "plist/PropertyList.h"

#include "base/Text.h"
#include "plist/BinaryReader.h"
#include "plist/XMLReader.h"

namespace plist {

base::Result<Value> read(std::string_view bytes) {
  if (bytes.empty()) return base::Error{"the property list is empty"};
  if (bytes.size() > kMaxSize) {
    return base::Error{
        base::format("the property list has %zu bytes, more than %zu", bytes.size(), kMaxSize)};
  }
  return bytes.starts_with("bplist") ? readBinary(bytes) : readXML(bytes);
}

}  // namespace plist
