// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// A recorded device: one whose root has a folder device/, which alone answers for all that is not a
// file of the device. What the folder doesn't hold, the device doesn't have.
#pragma once

#include "host/device/DeviceServices.h"
#include "host/files/DeviceRoot.h"
#include "host/recorded/EccEventFiles.h"
#include "platform/SystemLog.h"

namespace host::recorded {

// All are borrowed. Each service reads its file when it is first asked.
DeviceServices device(const DeviceRoot& root, platform::SystemLog& log, EccEventFiles& eccEvents);

}  // namespace host::recorded
