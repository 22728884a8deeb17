// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Standard output of a command.
#pragma once

#include <ostream>
#include <streambuf>
#include <vector>

namespace tools {

// The host ignores SIGPIPE, so that a reader who goes away doesn't cut its work off. Here that is
// no failure either: what would still be written is dropped, and at its very end the process ends
// as if the signal had ended it, without a word, as other commands do.
class StandardOutput : public std::ostream {
 public:
  StandardOutput() : std::ostream(nullptr) { rdbuf(&buffer_); }

  // Writes what is buffered. The status that main returns; doesn't return when the reader is gone.
  int end(int status);

 private:
  class Buffer : public std::streambuf {
   public:
    Buffer();
    bool readerIsGone() const { return readerIsGone_; }

   private:
    int sync() override;
    int_type overflow(int_type next) override;

    std::vector<char> bytes_;
    bool readerIsGone_ = false;
  };

  Buffer buffer_;
};

}  // namespace tools
