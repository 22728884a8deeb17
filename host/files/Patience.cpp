// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/files/Patience.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <system_error>

namespace host {

bool mayPass(const base::Error& error) {
  constexpr std::array kPassing{EIO, ENOSPC, EDQUOT, EMFILE, ENFILE, ENOMEM, EINTR, EAGAIN, EBUSY};
  return std::ranges::any_of(
      kPassing, [&error](int number) { return error.is(static_cast<std::errc>(number)); });
}

bool Patience::pausesAfter(int failed) {
  constexpr std::array<std::chrono::milliseconds, kMaxMore> kPauses{
      std::chrono::milliseconds(100), std::chrono::milliseconds(400),
      std::chrono::milliseconds(1500)};
  const std::chrono::milliseconds pause = kPauses[static_cast<std::size_t>(failed)];
  {
    const std::scoped_lock lock(mutex_);
    if (left_ < pause) return false;
    left_ -= pause;
  }
  pause_(pause);
  return true;
}

}  // namespace host
