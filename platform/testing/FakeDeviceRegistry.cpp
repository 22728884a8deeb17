// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "platform/testing/FakeDeviceRegistry.h"

#include <algorithm>
#include <span>
#include <string_view>

#include "base/ByteReader.h"
#include "base/ByteWriter.h"
#include "base/Text.h"

namespace platform::fakes {

namespace {

using Entry = FakeDeviceRegistry::Entry;

bool conforms(const Entry& entry, std::string_view className) {
  return entry.className == className ||
         std::find(entry.conforms.begin(), entry.conforms.end(), className) != entry.conforms.end();
}

// All below the entry, parents before children; backwards.
void collect(const Entry& entry, std::vector<const Entry*>& walk) {
  for (auto child = entry.children.rbegin(); child != entry.children.rend(); ++child) {
    collect(*child, walk);
    walk.push_back(&*child);
  }
}

std::vector<const Entry*> walkOf(const std::optional<Entry>& root) {
  std::vector<const Entry*> walk;
  if (root) collect(*root, walk);
  return walk;
}

std::uint32_t word(std::span<const std::byte> bytes, std::size_t offset) {
  return base::littleEndian<std::uint32_t>(bytes.subspan(offset).first<sizeof(std::uint32_t)>());
}

}  // namespace

Entry& FakeDeviceRegistry::add(Entry entry) {
  return root->children.emplace_back(std::move(entry));
}

FakeDeviceRegistry::Answer FakeDeviceRegistry::announce(std::uint32_t size) {
  Answer answer;
  base::appendLittleEndian(answer.output, size);
  return answer;
}

void FakeDeviceRegistry::willTunnel(std::uint32_t method, std::uint32_t opType,
                                    std::uint32_t argument, const Bytes& bytes) {
  script.push_back({base::format("%u size %u/%u", method, opType, argument),
                    announce(static_cast<std::uint32_t>(bytes.size()))});
  script.push_back({base::format("%u data %u/%u", method, opType, argument), {.output = bytes}});
}

void FakeDeviceRegistry::alwaysTunnels(std::uint32_t method, std::uint32_t opType,
                                       std::uint32_t argument, const Bytes& bytes) {
  standing[base::format("%u size %u/%u", method, opType, argument)] =
      announce(static_cast<std::uint32_t>(bytes.size()));
  standing[base::format("%u data %u/%u", method, opType, argument)] = {.output = bytes};
}

std::vector<std::string> FakeDeviceRegistry::problems() const {
  auto all = problems_;
  for (const Step& step : script) all.push_back("not called: " + step.call);
  if (!open_.empty()) all.push_back(base::format("%zu handles are open", open_.size()));
  return all;
}

RegistryObject FakeDeviceRegistry::handOut(Handle handle) {
  open_.emplace(++lastHandle_, std::move(handle));
  return lastHandle_;
}

FakeDeviceRegistry::Handle* FakeDeviceRegistry::find(std::uint32_t handle, Handle::Kind kind,
                                                     const char* user) {
  const auto found = open_.find(handle);
  if (found != open_.end() && found->second.kind == kind) return &found->second;
  problems_.push_back(base::format("%s: no such handle: %u", user, handle));
  return nullptr;
}

RegistryObject FakeDeviceRegistry::DrvGetMatchingService(std::string_view className) {
  const auto walk = walkOf(root);
  const auto found = std::find_if(walk.rbegin(), walk.rend(), [&](const Entry* entry) {
    return entry->registered && conforms(*entry, className);
  });
  return found != walk.rend() ? handOut({Handle::Kind::entry, *found, {}}) : 0;
}

RegistryObject FakeDeviceRegistry::rootEntry() {
  return root ? handOut({Handle::Kind::entry, &*root, {}}) : 0;
}

RegistryObject FakeDeviceRegistry::createIterator() {
  return canIterate ? handOut({Handle::Kind::iterator, nullptr, walkOf(root)}) : 0;
}

RegistryObject FakeDeviceRegistry::next(RegistryObject iterator) {
  Handle* handle = find(iterator, Handle::Kind::iterator, "next");
  if (handle == nullptr || handle->walk.empty()) return 0;
  const Entry* entry = handle->walk.back();
  handle->walk.pop_back();
  return handOut({Handle::Kind::entry, entry, {}});
}

bool FakeDeviceRegistry::conformsTo(RegistryObject entry, std::string_view className) {
  const Handle* handle = find(entry, Handle::Kind::entry, "conformsTo");
  return handle != nullptr && conforms(*handle->entry, className);
}

std::optional<plist::Value> FakeDeviceRegistry::searchProperty(RegistryObject entry,
                                                               std::string_view key,
                                                               Direction direction) {
  const Handle* handle = find(entry, Handle::Kind::entry, "searchProperty");
  if (handle == nullptr) return std::nullopt;
  std::vector<const Entry*> places{handle->entry};
  if (direction == Direction::children) {
    std::vector<const Entry*> below;
    collect(*handle->entry, below);
    places.insert(places.end(), below.rbegin(), below.rend());
  } else if (root) {
    auto all = walkOf(root);
    all.push_back(&*root);
    const auto isParent = [&](const Entry* parent) {
      return std::any_of(parent->children.begin(), parent->children.end(),
                         [&](const Entry& child) { return &child == places.back(); });
    };
    for (auto parent = all.begin(); parent != all.end();) {
      parent = std::find_if(all.begin(), all.end(), isParent);
      if (parent != all.end()) places.push_back(*parent);
    }
  }
  for (const Entry* place : places) {
    if (const plist::Value* value = place->properties.find(key)) return *value;
  }
  return std::nullopt;
}

void FakeDeviceRegistry::release(RegistryObject object) {
  const auto found = open_.find(object);
  if (found != open_.end() && found->second.kind != Handle::Kind::connection) {
    open_.erase(found);
  } else {
    problems_.push_back(base::format("release: no such handle: %u", object));
  }
}

DriverConnections::OpenResult FakeDeviceRegistry::DrvServiceOpen(RegistryObject service,
                                                                 std::uint32_t type) {
  const Handle* handle = find(service, Handle::Kind::entry, "DrvServiceOpen");
  if (handle == nullptr) return {kUnsupported, 0};
  const Entry* entry = handle->entry;
  calls.push_back("open " + entry->className);
  if (type != 0) problems_.push_back(base::format("opened with type %u", type));
  const bool opens = (entry->openStatus == 0) != entry->oddHandle;
  return {entry->openStatus, opens ? handOut({Handle::Kind::connection, entry, {}}) : 0};
}

DriverStatus FakeDeviceRegistry::DrvServiceClose(DriverConnection connection) {
  const Handle* handle = find(connection, Handle::Kind::connection, "DrvServiceClose");
  if (handle == nullptr) return kUnsupported;
  const auto status = handle->entry->closeStatus;
  open_.erase(connection);
  return status;
}

FakeDeviceRegistry::Answer FakeDeviceRegistry::answer(DriverConnection connection,
                                                      const std::string& call) {
  calls.push_back(call);
  if (find(connection, Handle::Kind::connection, call.c_str()) == nullptr) return {kUnsupported};
  if (script.empty()) {
    if (const auto found = standing.find(call); found != standing.end()) return found->second;
    if (standing.empty()) problems_.push_back("unexpected: " + call);
    return {kUnsupported};
  }
  Step step = std::move(script.front());
  script.pop_front();
  if (step.call == call) return std::move(step.answer);
  problems_.push_back("expected " + step.call + ", got " + call);
  return {kUnsupported};
}

DriverConnections::CallResult FakeDeviceRegistry::DrvCallStructMethod(
    DriverConnection connection, std::uint32_t method, std::span<const std::byte> input,
    std::span<std::byte> output) {
  inputs.emplace_back(input.begin(), input.end());
  std::string call = base::format("%u", method);
  if (input.size() == 24) {
    const std::uint32_t opType = word(input, 0), query = word(input, 4), index = word(input, 8);
    call += base::format(" %s %u/%u", (query & 1) != 0 ? "size" : "data", opType,
                         index != 0 ? index : query >> 2 & 0xFF);
  } else if (!input.empty()) {
    problems_.push_back(base::format("%u: an input of %zu bytes", method, input.size()));
  }
  const Answer answered = answer(connection, call);
  const std::size_t delivered = std::min(answered.output.size(), output.size());
  std::copy_n(answered.output.begin(), delivered, output.begin());
  return {answered.status, answered.claimedSize.value_or(delivered)};
}

DriverStatus FakeDeviceRegistry::DrvCallMethod(DriverConnection connection, std::uint32_t method,
                                               std::span<const std::uint64_t> input,
                                               std::span<std::uint64_t> output) {
  if (input.size() != 1 || output.size() != 1) {
    problems_.push_back(base::format("%u: not one scalar in and one out", method));
    return kUnsupported;
  }
  const Answer answered = answer(
      connection, base::format("%u(%llu)", method, static_cast<unsigned long long>(input.front())));
  if (answered.status == 0) output.front() = answered.scalar;
  return answered.status;
}

}  // namespace platform::fakes
