// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The support service's logs: var/log/servita/<name>.log, with the old ones as <name>.log.1 (the
// latest) to <name>.log.7.
#pragma once

#include "host/files/DeviceRoot.h"
#include "platform/ServitaLogs.h"
#include "platform/SystemLog.h"

namespace host {

class ServitaLogFiles final : public platform::ServitaLogs {
 public:
  // Both are borrowed.
  ServitaLogFiles(const DeviceRoot& root, platform::SystemLog& log) : root_(root), log_(log) {}

  // Rolls every log that has a current file. Old ones move up only as far as the first free number:
  // the gap that a killed roll-over left is filled, and nothing falls off the end before its time.
  // A log with anything but regular files in its way stays as it is, with an error line.
  void rollServitaLogs() override;

 private:
  const DeviceRoot& root_;
  platform::SystemLog& log_;
};

}  // namespace host
