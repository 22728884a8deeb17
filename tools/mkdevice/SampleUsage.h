// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What the processes of a sample device have sent and received.
#pragma once

#include "tools/mkdevice/Sample.h"

namespace mkdevice {

// As counted when `today` begins, each process since it was last started.
plist::Dictionary networkUsage(const Sample& sample);

}  // namespace mkdevice
