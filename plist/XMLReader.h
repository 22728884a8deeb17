// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Property lists from XML text.
#pragma once

#include <string_view>

#include "base/Result.h"
#include "plist/Value.h"

namespace plist {

// Reads a document in any encoding that expat knows, at most kMaxSize bytes. A
// DOCTYPE is ignored; one with an internal subset is refused, and so is every entity but the
// predefined ones. Where a key stands twice the later value counts. The error names line and
// column, both from 1.
base::Result<Value> readXML(std::string_view bytes);

}  // namespace plist
