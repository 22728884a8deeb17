// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/c/Options.h"

#include <algorithm>
#include <cstddef>
#include <cstring>

#include "NANDInfo/Controller.h"
#include "NANDInfo/Magazine.h"
#include "base/Text.h"

namespace NANDInfo {

namespace {

using base::Error;

// Programs that were built with this header go on with every later library.
constexpr std::size_t kFirstSize = sizeof(std::size_t) + 2 * sizeof(char*) + 16;
static_assert(sizeof(nandinfo_options) == kFirstSize && sizeof(nandinfo_error) == 512);
static_assert(offsetof(nandinfo_options, flags) == sizeof(std::size_t) + 2 * sizeof(char*));

// Beyond that it is no size, but what lay in the memory.
constexpr std::size_t kMaxSize = 4096;

struct FlagRow {
  std::uint32_t flag;
  const char* name;
  std::uint16_t takes;
};
constexpr FlagRow kFlags[] = {
    {NANDINFO_ROUND, "ROUND", kRound},        {NANDINFO_ALL, "ALL", kAll},
    {NANDINFO_STAT_KEYS, "STAT_KEYS", kAll},  {NANDINFO_HISTORY, "HISTORY", kWindow},
    {NANDINFO_NO_DELTA, "NO_DELTA", kWindow}, {NANDINFO_ACCUMULATING, "ACCUMULATING", kWindow},
    {NANDINFO_DYNAMIC, "DYNAMIC", kWindow},
};

base::Result<nandinfo_options> knownPart(const nandinfo_options& given) {
  if (given.size < kFirstSize || given.size > kMaxSize) {
    return Error{base::format("%zu bytes are no size of options", given.size)};
  }
  nandinfo_options known = {};
  std::memcpy(&known, &given, std::min(given.size, sizeof known));
  const auto* const bytes = reinterpret_cast<const unsigned char*>(&given);
  if (std::any_of(bytes + std::min(given.size, sizeof known), bytes + given.size,
                  [](unsigned char byte) { return byte != 0; }) ||
      known.reserved != 0) {
    return Error{"the options have a field that this library doesn't know"};
  }
  return known;
}

// Why an option can't be; empty if none is wrong.
std::string whyNot(const nandinfo_options& given, std::uint16_t takes) {
  const auto is = [&given](std::uint32_t flag) { return (given.flags & flag) != 0; };
  std::uint32_t unknown = given.flags;
  for (const auto& [flag, name, taken] : kFlags) {
    unknown &= ~flag;
    if (is(flag) && (takes & taken) == 0) return base::format("it doesn't take %s", name);
  }
  if (unknown != 0) return base::format("the flags 0x%x are unknown", unknown);
  const struct {
    bool given;
    const char* name;
    std::uint16_t taken;
  } fields[] = {{given.hours != 0, "hours", kWindow},
                {given.channels != 0, "channels", kChannels},
                {given.code != nullptr, "a code", kCode},
                {given.layout != nullptr, "a layout", kLayout}};
  for (const auto& [there, name, taken] : fields) {
    if (there && (takes & taken) == 0) return base::format("it doesn't take %s", name);
  }
  if (is(NANDINFO_ALL) && is(NANDINFO_ROUND)) return "ALL isn't rounded";
  if (is(NANDINFO_STAT_KEYS) && !is(NANDINFO_ALL)) return "STAT_KEYS goes with ALL only";
  constexpr std::uint32_t kOfHours = NANDINFO_NO_DELTA | NANDINFO_ACCUMULATING | NANDINFO_DYNAMIC;
  if (is(NANDINFO_HISTORY) && (given.hours != 0 || is(kOfHours))) return "HISTORY goes alone";
  if ((takes & kCode) != 0 && (given.code == nullptr || !isCode(given.code))) {
    return "it takes a code of four letters";
  }
  if ((takes & kLayout) != 0 &&
      (given.layout == nullptr || findCounterLayout(given.layout) == nullptr)) {
    std::string names;
    for (const CounterLayout& layout : counterLayouts()) {
      names.append(names.empty() ? "" : ", ").append(layout.name);
    }
    return "it takes a layout: " + names;
  }
  if (given.channels > kMaxBuffer / kChannelSize) return "there can't be so many channels";
  return {};
}

}  // namespace

base::Result<Options> readOptions(const nandinfo_options* given, std::uint16_t takes) {
  constexpr nandinfo_options kNone = {sizeof(nandinfo_options), nullptr, nullptr, 0, 0, 0, 0};
  const auto known = knownPart(given != nullptr ? *given : kNone);
  if (!known) return known.error();
  if (auto why = whyNot(*known, takes); !why.empty()) return Error{std::move(why)};
  const auto is = [&known](std::uint32_t flag) { return (known->flags & flag) != 0; };
  Options options;
  options.round = is(NANDINFO_ROUND);
  options.all = is(NANDINFO_ALL);
  options.statKeys = is(NANDINFO_STAT_KEYS);
  options.history = is(NANDINFO_HISTORY);
  options.noDelta = is(NANDINFO_NO_DELTA);
  if (is(NANDINFO_ACCUMULATING) != is(NANDINFO_DYNAMIC)) {
    options.mode = is(NANDINFO_DYNAMIC) ? kMagazineDynamic : kMagazineAccumulating;
  }
  options.hours = known->hours;
  options.channels = known->channels;
  if (known->code != nullptr) options.code = known->code;
  if (known->layout != nullptr) options.layout = known->layout;
  return options;
}

}  // namespace NANDInfo
