// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The dictionary of counters, for people who meet a name.
#pragma once

#include "tools/nandinfo/Commands.h"

namespace nandinfo {

// An array of {"name", "key": of the FTL, tag of an MSP, or "derived"; "elements", "digits",
// "whitelists", "magazine", "events", "countersKey"}, what a counter doesn't have being left out.
// Elements that differ in nothing but their index stand together, as "padSizes_{0..3}". With names,
// only what goes by them: a counter, an array's elements, a key of the counters service; a name
// that nothing has is an error.
CommandResult counters(const Invocation& invocation);

}  // namespace nandinfo
