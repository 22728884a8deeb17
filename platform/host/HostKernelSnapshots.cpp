#include "platform/host/HostKernelSnapshots.h"

namespace platform::host {

std::optional<std::vector<std::byte>> HostKernelSnapshots::capture(std::uint32_t) {
  (void)root_;
  return std::nullopt;
}

}  // namespace platform::host
