// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Property lists as XML text.
#pragma once

#include <string>

#include "base/Result.h"
#include "plist/Value.h"

namespace plist {

// Writes XML, version 1.0. What can't stand in XML (characters that it forbids, text that is not
// UTF-8) becomes U+FFFD; dates are in whole seconds. Fails on nesting deeper than kMaxDepth. `read`
// reads an equal value from it.
base::Result<std::string> writeXML(const Value& value);

}  // namespace plist
