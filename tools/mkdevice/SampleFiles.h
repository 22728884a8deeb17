// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The files of a sample device that stay.
#pragma once

#include <vector>

#include "tools/mkdevice/Sample.h"

namespace mkdevice {

// What stays from day to day: the whitelist, most files below device/, the preferences; and logs of
// the days before.
std::vector<SampleFile> lastingFiles(const Sample& sample);

}  // namespace mkdevice
