// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The files of a recorded device: below the root as any device's, but how large its file system is
// stands in its properties.
#pragma once

#include <optional>
#include <string_view>

#include "host/files/DeviceFileSystem.h"
#include "host/recorded/DeviceProperties.h"

namespace host::recorded {

class FileSystem final : public DeviceFileSystem {
 public:
  // Both are borrowed.
  FileSystem(const DeviceRoot& root, DeviceProperties& properties)
      : DeviceFileSystem(root), properties_(properties) {}

  // Of any path.
  std::optional<Statistics> statfs(std::string_view) override { return properties_.fileSystem(); }

 private:
  DeviceProperties& properties_;
};

}  // namespace host::recorded
