// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Identifiers that nobody else has.
#pragma once

#include <array>
#include <cstdint>
#include <string>

namespace host {

// A random UUID (version 4) in canonical text, as in "0f6d3c1e-58b2-4c0a-9d53-7e2f8a41b6c9".
std::string randomUUID();

// The UUID that is made of these random numbers. By hand, because sd-id128 takes none: a sample
// device's UUIDs come from its seed.
std::string UUIDFrom(std::array<std::uint32_t, 4> words);

}  // namespace host
