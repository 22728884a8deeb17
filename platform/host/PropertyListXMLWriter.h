// Property lists as XML text.
#pragma once

#include <string>

#include "platform/PropertyList.h"
#include "platform/Result.h"

namespace platform::host {

// The whole document, in the form that PropertyListCodec::writeXML describes; dates in whole
// seconds. readXMLPropertyList reads an equal value from it.
Result<std::string> writeXMLPropertyList(const Value& value);

}  // namespace platform::host
