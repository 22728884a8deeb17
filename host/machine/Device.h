// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// This machine as the device: what Linux answers for a root that is not a recorded device.
// docs/MACHINE.md says where each answer comes from, and what happens without it.
#pragma once

#include "host/device/DeviceServices.h"
#include "host/files/DeviceRoot.h"
#include "platform/PreferenceStore.h"
#include "platform/SystemLog.h"

namespace host::machine {

// All are borrowed. `files` is the folder whose /proc, /sys, /etc and /usr are read, each of them
// when a service is first asked for what it says; `preferences` keep what the services must
// remember.
DeviceServices device(const DeviceRoot& root, const DeviceRoot& files,
                      platform::PreferenceStore& preferences, platform::SystemLog& log);

}  // namespace host::machine
