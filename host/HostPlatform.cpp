#include "host/HostPlatform.h"

#include "host/Host.h"

namespace host {

std::shared_ptr<platform::Platform> makeHostPlatform() {
  const auto host = std::make_shared<Host>();
  return {host, &host->platform()};
}

bool PLIsInternalDevice() {
  static const bool internal = Host().context().PLIsInternalDevice();
  return internal;
}

}  // namespace host
