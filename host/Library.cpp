// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/Library.h"

#include "host/Host.h"

namespace host {

std::shared_ptr<const platform::AllServices> makeServices() {
  const auto host = std::make_shared<Host>();
  return {host, &host->services()};
}

bool PLIsInternalDevice() {
  static const bool internal = Host().context().PLIsInternalDevice();
  return internal;
}

}  // namespace host
