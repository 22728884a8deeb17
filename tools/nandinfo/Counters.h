// The dictionary of counters, for people who meet a name.
#pragma once

#include "tools/nandinfo/Commands.h"

namespace nandinfo {

// An array of {"name", "key": of the FTL, tag of an MSP, or "derived"; "elements", "digits",
// "whitelists", "magazine", "events", "countersKey"}, what a counter doesn't have being left out.
// Elements that differ in nothing but their index stand together, as "padSizes_{0..3}". With names,
// only the counters of that name, and the elements of arrays of that name; one that nothing has is
// an error.
CommandResult counters(const Invocation& invocation);

}  // namespace nandinfo
