// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What can be asked of a device by name: one row a query. None changes anything on the device, nor
// sends anything from it.
#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <string_view>

#include "NANDInfo/Magazine.h"
#include "NANDInfo/Services.h"
#include "plist/Value.h"

namespace NANDInfo {

// Each query looks at its own part.
struct QueryOptions {
  bool round = false, all = false, statKeys = false, noDelta = false, history = false;
  std::uint32_t hours = 0, mode = kMagazineBoth;
  std::string code;  // of an image
};

// The options that a query takes: `round`; `all` and, with it, `statKeys`, but not with `round`;
// the code, which there must be; either `history` or the hours with `noDelta` and the mode.
enum QueryTakes : std::uint16_t {
  kNothing = 0,
  kRound = 1,
  kAll = 2,
  kCode = 4,
  kWindow = 8,
  kQueryTakesEnd = 16,  // who has further options counts them from here
};

// What a query needs before its result means something: not even a device; nothing of a storage
// controller; that it can be opened (and who asks says so himself when it can't); an answer.
enum class Needs : std::uint8_t { noDevice, nothing, controller, answer };

struct Query {
  const char* group;  // the word before the name, or null
  const char* name;
  const char* description;
  std::uint16_t takes;  // of QueryTakes
  Needs needs;
  const char* empty;  // what an empty result means to a person, or null
  std::optional<plist::Value> (*ask)(const Services& services, const QueryOptions& options);
};

// Queries of one group stand together. A query may have the name of the group that follows it: it
// is what the group's word alone means.
std::span<const Query> queries();

// Group and name with a blank between them, or the name alone.
std::string nameOf(const Query& query);

// Whether a text is the code of an image: four printable characters.
bool isCode(std::string_view text);

}  // namespace NANDInfo
