// Property lists from XML text.
#pragma once

#include <string_view>

#include "platform/PropertyList.h"
#include "platform/Result.h"

namespace platform::host {

// Reads a document in any encoding that expat knows, at most kMaximumPropertyListSize bytes. A
// DOCTYPE is ignored; one with an internal subset is refused, and so is every entity but the
// predefined ones. Where a key stands twice the later value counts. The error names line and
// column, both from 1.
Result<Value> readXMLPropertyList(std::string_view bytes);

}  // namespace platform::host
