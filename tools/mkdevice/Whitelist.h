// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What a sample device lets out.
#pragma once

#include "plist/Value.h"

namespace mkdevice {

// The whitelist: key groups, their sections, the entries' options.
plist::Dictionary whitelist(int scale);

}  // namespace mkdevice
