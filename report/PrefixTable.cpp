// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "report/PrefixTable.h"

#include <algorithm>
#include <cstring>
#include <utility>

namespace report {

namespace {

std::size_t commonLength(std::string_view a, std::string_view b) {
  const auto end = std::min(a.size(), b.size());
  std::size_t length = 0;
  while (length < end && a[length] == b[length]) ++length;
  return length;
}

}  // namespace

PrefixTable::PrefixTable(OptionsTable prefixes) : prefixes_(std::move(prefixes)) {
  std::vector<std::pair<std::string_view, const CounterOptions*>> sorted;
  for (const auto& [text, options] : prefixes_.entries()) sorted.emplace_back(text, &options);
  std::sort(sorted.begin(), sorted.end());

  // Breadth first, so that a node's children come to stand together. A range of the sorted texts
  // waits for each node; `length` is what its texts have in common, the node's label included.
  struct Range {
    std::size_t begin, end, length;
  };
  std::vector<Range> ranges{{0, sorted.size(), 0}};
  nodes_.push_back({});
  firstBytes_.push_back('\0');
  for (std::size_t node = 0; node < nodes_.size(); ++node) {
    auto [begin, end, length] = ranges[node];
    if (begin < end && sorted[begin].first.size() == length) {
      nodes_[node].options = sorted[begin++].second;
    }
    nodes_[node].firstChild = static_cast<std::uint32_t>(nodes_.size());
    while (begin < end) {
      const std::string_view text = sorted[begin].first;
      std::size_t last = begin + 1;
      while (last < end && sorted[last].first[length] == text[length]) ++last;
      const std::size_t common = commonLength(text, sorted[last - 1].first);
      nodes_.push_back({text.substr(length, common - length), nullptr, 0, 0});
      firstBytes_.push_back(text[length]);
      ranges.push_back({begin, last, common});
      begin = last;
    }
    nodes_[node].childCount = static_cast<std::uint32_t>(nodes_.size()) - nodes_[node].firstChild;
  }
}

PrefixTable::Match PrefixTable::longestPrefix(std::string_view key) const {
  Match match{{}, nodes_[0].options};
  const Node* node = &nodes_[0];
  std::size_t length = 0;
  while (node->childCount > 0 && length < key.size()) {
    const char* bytes = firstBytes_.data() + node->firstChild;
    const void* found = std::memchr(bytes, key[length], node->childCount);
    if (found == nullptr) break;
    node = &nodes_[node->firstChild +
                   static_cast<std::size_t>(static_cast<const char*>(found) - bytes)];
    if (key.compare(length, node->label.size(), node->label) != 0) break;
    length += node->label.size();
    if (node->options != nullptr) match = {key.substr(0, length), node->options};
  }
  return match;
}

}  // namespace report
