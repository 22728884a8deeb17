// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/nandinfo/Counters.h"

#include <algorithm>
#include <charconv>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "NANDInfo/CounterDictionary.h"
#include "base/Text.h"
#include "tools/common/ClosestName.h"

namespace nandinfo {

namespace {

using NANDInfo::CounterEntry;
using plist::Array;
using plist::Dictionary;

// A text that ends in a number.
struct Numbered {
  explicit Numbered(std::string_view text)
      : stem(text.substr(0, text.find_last_not_of("0123456789") + 1)) {
    const char* const end = text.data() + text.size();
    isNumbered = std::from_chars(text.data() + stem.size(), end, number).ptr != stem.end();
  }
  std::string_view stem;
  std::uint32_t number = 0;
  bool isNumbered;
};

bool follows(std::string_view key, std::string_view before) {
  const Numbered next(key), last(before);
  return key.empty() ? before.empty()
                     : next.isNumbered && last.isNumbered && next.stem == last.stem &&
                           next.number == last.number + 1;
}

// Whether an entry is the element after another one, and alike.
bool continues(const CounterEntry& next, const CounterEntry& last) {
  return !last.array.empty() && next.array == last.array && next.buffer == last.buffer &&
         next.key == last.key && next.index == last.index + 1 && next.digits == last.digits &&
         next.whitelists == last.whitelists && next.magazine == last.magazine &&
         next.events == last.events && follows(next.countersKey, last.countersKey);
}

std::string range(std::string_view stem, std::uint32_t first, std::uint32_t last) {
  return base::format("%.*s{%u..%u}", static_cast<int>(stem.size()), stem.data(), first, last);
}

std::string keyOf(const CounterEntry& entry) {
  switch (entry.buffer) {
    case CounterEntry::Buffer::FTL:
      return std::to_string(entry.key);
    case CounterEntry::Buffer::MSP:
      return base::format("0x%04X", entry.key);
    case CounterEntry::Buffer::none:
      break;
  }
  return "derived";
}

// The row of entries that continue each other.
Dictionary rowOf(std::span<const CounterEntry> entries) {
  const CounterEntry& first = entries.front();
  const CounterEntry& last = entries.back();
  std::string name = first.name, countersKey(first.countersKey);
  if (entries.size() > 1) {
    name.resize(name.size() - std::to_string(first.index).size());
    name = range(name, first.index, last.index);
    const Numbered from(first.countersKey), to(last.countersKey);
    if (!countersKey.empty()) countersKey = range(from.stem, from.number, to.number);
  }
  Dictionary row{{"name", name}, {"key", keyOf(first)}, {"elements", std::int64_t{first.elements}}};
  const auto set = [&row](const char* key, const std::vector<std::string_view>& texts) {
    if (!texts.empty()) row.set(key, Array(texts.begin(), texts.end()));
  };
  if (first.digits) row.set("digits", std::int64_t{*first.digits});
  set("whitelists", first.whitelists);
  if (!first.magazine.empty()) row.set("magazine", first.magazine);
  set("events", first.events);
  if (!countersKey.empty()) row.set("countersKey", countersKey);
  return row;
}

std::string unknown(const std::string& name, const std::vector<CounterEntry>& dictionary) {
  std::vector<std::string_view> names;
  for (const CounterEntry& entry : dictionary) {
    names.push_back(entry.name);
    if (entry.index == 0 && !entry.array.empty()) names.push_back(entry.array);
  }
  const std::string closest(tools::closestName(name, names));
  return "there is no counter '" + name + "'" +
         (closest.empty() ? "" : "; did you mean '" + closest + "'?");
}

}  // namespace

CommandResult counters(const Invocation& invocation) {
  std::vector<CounterEntry> dictionary = NANDInfo::counterDictionary();
  const std::vector<std::string>& names = invocation.arguments.names;
  const auto isCalled = [](const std::string& name) {
    return [&name](const CounterEntry& entry) {
      return entry.name == name || entry.array == name || entry.countersKey == name;
    };
  };
  for (const std::string& name : names) {
    if (std::ranges::none_of(dictionary, isCalled(name))) {
      return base::Error{unknown(name, dictionary)};
    }
  }
  if (!names.empty()) {
    std::erase_if(dictionary, [&](const CounterEntry& entry) {
      return std::ranges::none_of(names,
                                  [&](const std::string& name) { return isCalled(name)(entry); });
    });
  }
  Array rows;
  for (std::span<const CounterEntry> rest = dictionary; !rest.empty();) {
    const auto end = std::ranges::adjacent_find(
        rest, [](const auto& last, const auto& next) { return !continues(next, last); });
    const std::size_t count =
        end == rest.end() ? rest.size() : static_cast<std::size_t>(end - rest.begin()) + 1;
    rows.push_back(rowOf(rest.first(count)));
    rest = rest.subspan(count);
  }
  return plist::Value(std::move(rows));
}

}  // namespace nandinfo
