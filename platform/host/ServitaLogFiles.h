// The support service's logs: var/log/servita/<name>.log, with the old ones as <name>.log.1 (the
// latest) to <name>.log.7.
#pragma once

#include "platform/ServitaLogs.h"
#include "platform/SystemLog.h"
#include "platform/host/DeviceRoot.h"

namespace platform::host {

class ServitaLogFiles final : public ServitaLogs {
 public:
  // Both are borrowed.
  ServitaLogFiles(const DeviceRoot& root, SystemLog& log) : root_(root), log_(log) {}

  // Rolls every log that has a current file. Old ones move up only as far as the first free number:
  // the gap that a killed roll-over left is filled, and nothing falls off the end before its time.
  // A log with anything but regular files in its way stays as it is, with an error line.
  void rollServitaLogs() override;

 private:
  const DeviceRoot& root_;
  SystemLog& log_;
};

}  // namespace platform::host
