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
  // So many in a row are said.
  explicit FloodGate(std::size_t maxSaid) : maxSaid_(maxSaid) {}

  // Whether a message of this kind is said; `before` is then to be said first, of those of the last
  // kind that weren't.
  struct Next {
    bool said;
    std::optional<std::string> before = {};
  };
  Next next(std::string_view kind, std::string_view message);

  // Ends the row: what is left to say of it.
  std::optional<std::string> end();

 private:
  const std::size_t maxSaid_;
  std::string kind_;
  std::string lastSaid_;
  std::size_t inARow_ = 0;
};

}  // namespace host
