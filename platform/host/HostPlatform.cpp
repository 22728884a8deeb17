#include "platform/host/HostPlatform.h"

#include "platform/host/Host.h"

namespace platform::host {

std::shared_ptr<Platform> makeHostPlatform() {
  const auto host = std::make_shared<Host>();
  return {host, &host->platform()};
}

bool PLIsInternalDevice() {
  static const bool internal = Host().context().PLIsInternalDevice();
  return internal;
}

}  // namespace platform::host
