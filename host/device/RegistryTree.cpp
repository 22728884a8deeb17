// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/device/RegistryTree.h"

#include <algorithm>
#include <cstddef>
#include <span>
#include <string>
#include <string_view>
#include <utility>

namespace host {

namespace {

bool conforms(const plist::Dictionary& content, std::string_view className) {
  const std::string* ownClass = content.text("Class");
  if (ownClass != nullptr && *ownClass == className) return true;
  const plist::Array* others = content.array("Conforms");
  return others != nullptr && std::ranges::any_of(*others, [&](const plist::Value& other) {
           const auto* name = other.as<std::string>();
           return name != nullptr && *name == className;
         });
}

bool isRegistered(const plist::Dictionary& content) {
  const plist::Number* registered = content.number("Registered");
  return registered == nullptr || registered->boolValue();
}

const plist::Value* property(const plist::Dictionary& content, std::string_view key) {
  const plist::Dictionary* properties = content.dictionary("Properties");
  return properties != nullptr ? properties->find(key) : nullptr;
}

}  // namespace

RegistryTree::~RegistryTree() {
  if (handles_.empty()) return;
  log_.log(platform::LogLevel::error, "%zu driver handles were not released", handles_.size());
}

const std::vector<RegistryTree::Entry>& RegistryTree::entries() {
  if (!isRead_) {
    isRead_ = true;
    if (const plist::Dictionary* root = tree()) add(*root, 0);
  }
  return entries_;
}

// No deeper than the property list, whose depth is limited.
void RegistryTree::add(const plist::Dictionary& content, std::size_t parent) {
  const std::size_t place = entries_.size();
  entries_.push_back({content, parent, 0});
  if (const plist::Array* children = content.array("Children")) {
    for (const plist::Value& child : *children) {
      if (const auto* entry = child.as<plist::Dictionary>()) add(*entry, place);
    }
  }
  entries_[place].end = entries_.size();
}

std::uint32_t RegistryTree::handOut(Kind kind, std::size_t place) {
  do {
    ++lastHandle_;
  } while (lastHandle_ == 0 || !handles_.try_emplace(lastHandle_, Handle{kind, place}).second);
  return lastHandle_;
}

RegistryTree::Handle* RegistryTree::held(std::uint32_t handle, Kind kind) {
  const auto found = handles_.find(handle);
  return found != handles_.end() && found->second.kind == kind ? &found->second : nullptr;
}

platform::RegistryObject RegistryTree::DrvGetMatchingService(std::string_view className) {
  for (std::size_t place = 1; place < entries().size(); ++place) {
    const plist::Dictionary& content = entries_[place].content;
    if (isRegistered(content) && conforms(content, className)) return handOut(Kind::entry, place);
  }
  return 0;
}

platform::RegistryObject RegistryTree::rootEntry() {
  return entries().empty() ? 0 : handOut(Kind::entry, 0);
}

platform::RegistryObject RegistryTree::createIterator() {
  return entries().empty() ? 0 : handOut(Kind::iterator, 1);
}

platform::RegistryObject RegistryTree::next(platform::RegistryObject iterator) {
  Handle* handle = held(iterator, Kind::iterator);
  if (handle == nullptr || handle->place >= entries_.size()) return 0;
  return handOut(Kind::entry, handle->place++);
}

bool RegistryTree::conformsTo(platform::RegistryObject entry, std::string_view className) {
  const Handle* handle = held(entry, Kind::entry);
  return handle != nullptr && conforms(entries_[handle->place].content, className);
}

std::optional<plist::Value> RegistryTree::searchProperty(platform::RegistryObject entry,
                                                         std::string_view key,
                                                         Direction direction) {
  const Handle* handle = held(entry, Kind::entry);
  if (handle == nullptr) return std::nullopt;
  const Entry& start = entries_[handle->place];
  for (std::size_t place = handle->place;;) {
    if (const plist::Value* found = property(entries_[place].content, key)) return *found;
    const std::size_t after = direction == Direction::parents ? entries_[place].parent : place + 1;
    if (after == place || after == start.end) return std::nullopt;
    place = after;
  }
}

void RegistryTree::release(platform::RegistryObject object) {
  if (held(object, Kind::connection) == nullptr) handles_.erase(object);
}

std::optional<DescribedDriver> RegistryTree::driverAt(std::size_t place) {
  const plist::Dictionary* answers = entries_[place].content.dictionary("Driver");
  return answers != nullptr ? std::optional<DescribedDriver>(std::in_place, *answers, files_)
                            : std::nullopt;
}

std::optional<DescribedDriver> RegistryTree::driverOf(platform::DriverConnection connection) {
  const Handle* handle = held(connection, Kind::connection);
  return handle != nullptr ? driverAt(handle->place) : std::nullopt;
}

platform::DriverConnections::OpenResult RegistryTree::DrvServiceOpen(
    platform::RegistryObject service, std::uint32_t) {
  const Handle* handle = held(service, Kind::entry);
  if (handle == nullptr) return {kDriverFailed, 0};
  const std::size_t place = handle->place;
  const auto driver = driverAt(place);
  if (!driver || driver->refusesOpen()) return {kDriverFailed, 0};
  return {0, handOut(Kind::connection, place)};
}

platform::DriverStatus RegistryTree::DrvServiceClose(platform::DriverConnection connection) {
  const auto driver = driverOf(connection);
  if (!driver) return kDriverFailed;
  handles_.erase(connection);
  return driver->failsClose() ? kDriverFailed : 0;
}

platform::DriverConnections::CallResult RegistryTree::DrvCallStructMethod(
    platform::DriverConnection connection, std::uint32_t method, std::span<const std::byte> input,
    std::span<std::byte> output) {
  const auto driver = driverOf(connection);
  if (!driver) return {kDriverFailed, 0};
  return driver->callStructMethod(method, input, output);
}

platform::DriverStatus RegistryTree::DrvCallMethod(platform::DriverConnection connection,
                                                   std::uint32_t method,
                                                   std::span<const std::uint64_t> input,
                                                   std::span<std::uint64_t> output) {
  const auto driver = driverOf(connection);
  return driver ? driver->callScalarMethod(method, input, output) : kDriverFailed;
}

}  // namespace host
