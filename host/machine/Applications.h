// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The installed applications: the desktop entries that are shown.
#pragma once

#include <functional>

#include "host/files/DeviceRoot.h"
#include "platform/InstalledApplications.h"

namespace host::machine {

class Applications final : public platform::InstalledApplications {
 public:
  explicit Applications(const DeviceRoot& files) : files_(files) {}

  // Those in the system's folders (below /usr) are of the system; those of added runtimes, and of
  // the users below /home whose folders can be read, are the user's. An identifier counts once, in
  // the first of the folders that has it: one that hides an entry there hides it.
  void enumerateBundles(const std::function<void(BundleType)>& handler) override;

 private:
  const DeviceRoot& files_;
};

}  // namespace host::machine
