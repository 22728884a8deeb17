// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The statistics of the boot variables' memory: properties of a service and of what lies below it.

#include <array>

#include "Input.h"
#include "NANDInfo/Extraction.h"
#include "platform/testing/FakePlatform.h"

namespace {

using fuzz::require;
using Entry = platform::fakes::FakeDeviceRegistry::Entry;

constexpr std::string_view kWords[] = {"CommonUsed", "SystemUsed", "Generation",
                                       "Version",    "commonused", "NvramDiagService"};
constexpr std::array<std::pair<const char*, const char*>, 4> kFields = {
    {{"CommonUsed", "commonused"},
     {"SystemUsed", "systemused"},
     {"Generation", "norwrites"},
     {"Version", "version"}}};

Entry entry(fuzz::Input& input, fuzz::Values& values, int depth) {
  const unsigned head = input.number<std::uint8_t>();
  Entry made{.className = head % 4 == 0 ? values.text() : "NvramDiagService",
             .registered = head % 8 != 1,
             .properties = values.dictionary(head >> 3 & 7)};
  for (unsigned i = 0; i < head >> 6 && depth < 4 && !input.empty(); ++i) {
    made.children.push_back(entry(input, values, depth + 1));
  }
  return made;
}

// The first place that has the property, from the entry down.
const plist::Value* find(const Entry& entry, const char* property) {
  const plist::Value* found = entry.properties.find(property);
  for (auto child = entry.children.begin(); !found && child != entry.children.end(); ++child) {
    found = find(*child, property);
  }
  return found;
}

const Entry* service(const Entry& entry) {
  for (const Entry& child : entry.children) {
    if (child.registered && child.className == "NvramDiagService") return &child;
    if (const Entry* found = service(child)) return found;
  }
  return nullptr;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  platform::fakes::FakePlatform platform;
  fuzz::Input input(bytes, size);
  fuzz::Values values(input, kWords);
  platform.registry.add(entry(input, values, 0));
  const auto sent = NANDInfo::gatherNVRAMStats(platform.platform);
  const auto& events = platform.eventra.events;
  require(events.size() == (sent.empty() ? 0 : 1), "one event of what there is");
  require(sent.empty() || events[0].second == sent, "and of nothing else");
  const Entry* from = service(*platform.registry.root);
  std::size_t expected = 0;
  for (const auto& [property, field] : kFields) {
    const plist::Value* wanted = from != nullptr ? find(*from, property) : nullptr;
    const plist::Value* got = sent.find(field);
    require((got == nullptr) == (wanted == nullptr), "a property that is there is sent");
    require(got == nullptr || *got == *wanted, "as it is");
    expected += got != nullptr;
  }
  require(sent.size() == expected, "no other field is sent");
  require(platform.registry.problems().empty(), "every handle is given back");
  return 0;
}
