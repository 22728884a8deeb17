// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/common/StandardOutput.h"

#include <unistd.h>

#include <csignal>
#include <string_view>
#include <system_error>

#include "host/files/Files.h"

namespace tools {

StandardOutput::Buffer::Buffer() : bytes_(std::size_t{1} << 16) {
  setp(bytes_.data(), bytes_.data() + bytes_.size());
}

int StandardOutput::Buffer::sync() {
  const std::string_view text(pbase(), static_cast<std::size_t>(pptr() - pbase()));
  setp(bytes_.data(), bytes_.data() + bytes_.size());
  if (readerIsGone_) return 0;
  const auto written = host::writeAll(STDOUT_FILENO, text);
  readerIsGone_ = !written && written.error().is(std::errc::broken_pipe);
  return written || readerIsGone_ ? 0 : -1;
}

StandardOutput::Buffer::int_type StandardOutput::Buffer::overflow(int_type next) {
  if (sync() != 0) return traits_type::eof();
  if (!traits_type::eq_int_type(next, traits_type::eof())) sputc(traits_type::to_char_type(next));
  return traits_type::not_eof(next);
}

int StandardOutput::end(int status) {
  flush();
  if (!buffer_.readerIsGone()) return status;
  std::signal(SIGPIPE, SIG_DFL);
  std::raise(SIGPIPE);
  return 128 + SIGPIPE;  // the signal is blocked
}

}  // namespace tools
