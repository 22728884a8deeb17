// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The registry of installed applications.
#pragma once

#include <functional>

namespace platform {

class InstalledApplications {
 public:
  enum class BundleType { system, user };

  virtual ~InstalledApplications() = default;

  // Calls the handler once for each installed application bundle.
  virtual void enumerateBundles(const std::function<void(BundleType type)>& handler) = 0;
};

}  // namespace platform
