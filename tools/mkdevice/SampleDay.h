// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The files of a sample device that each day brings.
#pragma once

#include <vector>

#include "tools/mkdevice/Sample.h"

namespace mkdevice {

// What is new every day, as it is when `today` begins: the buffers of the controller, disk and
// network usage, the reporting channels, the memory errors that came in, and the kernel's values.
// Yesterday's logs of the support service are among them: a daily run moves them.
std::vector<SampleFile> filesOfDay(const Sample& sample);

}  // namespace mkdevice
