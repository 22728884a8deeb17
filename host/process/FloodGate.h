// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Keeps floods out of what people read: of messages of one kind that come in a row the first few
// are said, the rest is counted.
#pragma once

#include <cstddef>
#include <optional>
#include <string>
#include <string_view>

namespace host {

class FloodGate {
 public:
  // Whether a message of this kind is said, of which `maxSaid` in a row are; `before` is then to be
  // said first, of those of the last kind that weren't.
  struct Next {
    bool said;
    std::optional<std::string> before = {};
  };
  Next next(std::string_view kind, std::string_view message, std::size_t maxSaid);

  // Ends the row: what is left to say of it, which is how many there were beyond, or the message if
  // that was one.
  std::optional<std::string> end();

 private:
  std::string kind_;
  std::string lastSaid_, notSaid_;
  std::size_t inARow_ = 0, maxSaid_ = 0;
};

}  // namespace host
