#include "platform/host/HostDeviceRegistry.h"

#include <algorithm>

namespace platform::host {

namespace {

bool conforms(const Dictionary& content, std::string_view className) {
  const std::string* ownClass = content.text("Class");
  if (ownClass != nullptr && *ownClass == className) return true;
  const Array* others = content.array("Conforms");
  return others != nullptr && std::ranges::any_of(*others, [&](const Value& other) {
           const auto* name = other.as<std::string>();
           return name != nullptr && *name == className;
         });
}

bool isRegistered(const Dictionary& content) {
  const Number* registered = content.number("Registered");
  return registered == nullptr || registered->boolValue();
}

const Value* property(const Dictionary& content, std::string_view key) {
  const Dictionary* properties = content.dictionary("Properties");
  return properties != nullptr ? properties->find(key) : nullptr;
}

}  // namespace

HostDeviceRegistry::~HostDeviceRegistry() {
  if (handles_.empty()) return;
  log_.log(LogLevel::error, "%zu driver handles were not released", handles_.size());
}

const std::vector<HostDeviceRegistry::Entry>& HostDeviceRegistry::entries() {
  if (!isRead_) {
    isRead_ = true;
    if (const Dictionary* root = file_.dictionary()) add(*root, 0);
  }
  return entries_;
}

// No deeper than the property list, whose depth is limited.
void HostDeviceRegistry::add(const Dictionary& content, std::size_t parent) {
  const std::size_t place = entries_.size();
  entries_.push_back({content, parent, 0});
  if (const Array* children = content.array("Children")) {
    for (const Value& child : *children) {
      if (const auto* entry = child.as<Dictionary>()) add(*entry, place);
    }
  }
  entries_[place].end = entries_.size();
}

std::uint32_t HostDeviceRegistry::handOut(Kind kind, std::size_t place) {
  do {
    ++lastHandle_;
  } while (lastHandle_ == 0 || !handles_.try_emplace(lastHandle_, Handle{kind, place}).second);
  return lastHandle_;
}

HostDeviceRegistry::Handle* HostDeviceRegistry::held(std::uint32_t handle, Kind kind) {
  const auto found = handles_.find(handle);
  return found != handles_.end() && found->second.kind == kind ? &found->second : nullptr;
}

RegistryObject HostDeviceRegistry::DrvGetMatchingService(std::string_view className) {
  for (std::size_t place = 1; place < entries().size(); ++place) {
    const Dictionary& content = entries_[place].content;
    if (isRegistered(content) && conforms(content, className)) return handOut(Kind::entry, place);
  }
  return 0;
}

RegistryObject HostDeviceRegistry::rootEntry() {
  return entries().empty() ? 0 : handOut(Kind::entry, 0);
}

RegistryObject HostDeviceRegistry::createIterator() {
  return entries().empty() ? 0 : handOut(Kind::iterator, 1);
}

RegistryObject HostDeviceRegistry::next(RegistryObject iterator) {
  Handle* handle = held(iterator, Kind::iterator);
  if (handle == nullptr || handle->place >= entries_.size()) return 0;
  return handOut(Kind::entry, handle->place++);
}

bool HostDeviceRegistry::conformsTo(RegistryObject entry, std::string_view className) {
  const Handle* handle = held(entry, Kind::entry);
  return handle != nullptr && conforms(entries_[handle->place].content, className);
}

std::optional<Value> HostDeviceRegistry::searchProperty(RegistryObject entry, std::string_view key,
                                                        Direction direction) {
  const Handle* handle = held(entry, Kind::entry);
  if (handle == nullptr) return std::nullopt;
  const Entry& start = entries_[handle->place];
  for (std::size_t place = handle->place;;) {
    if (const Value* found = property(entries_[place].content, key)) return *found;
    const std::size_t after = direction == Direction::parents ? entries_[place].parent : place + 1;
    if (after == place || after == start.end) return std::nullopt;
    place = after;
  }
}

void HostDeviceRegistry::release(RegistryObject object) {
  if (held(object, Kind::connection) == nullptr) handles_.erase(object);
}

std::optional<SimulatedDriver> HostDeviceRegistry::driverAt(std::size_t place) {
  const Dictionary* answers = entries_[place].content.dictionary("Driver");
  return answers != nullptr ? std::optional<SimulatedDriver>(std::in_place, *answers, files_)
                            : std::nullopt;
}

std::optional<SimulatedDriver> HostDeviceRegistry::driverOf(DriverConnection connection) {
  const Handle* handle = held(connection, Kind::connection);
  return handle != nullptr ? driverAt(handle->place) : std::nullopt;
}

DriverConnections::OpenResult HostDeviceRegistry::DrvServiceOpen(RegistryObject service,
                                                                 std::uint32_t) {
  const Handle* handle = held(service, Kind::entry);
  if (handle == nullptr) return {kDriverFailed, 0};
  const std::size_t place = handle->place;
  const auto driver = driverAt(place);
  if (!driver || driver->refusesOpen()) return {kDriverFailed, 0};
  return {0, handOut(Kind::connection, place)};
}

DriverStatus HostDeviceRegistry::DrvServiceClose(DriverConnection connection) {
  const auto driver = driverOf(connection);
  if (!driver) return kDriverFailed;
  handles_.erase(connection);
  return driver->failsClose() ? kDriverFailed : 0;
}

DriverConnections::CallResult HostDeviceRegistry::DrvCallStructMethod(
    DriverConnection connection, std::uint32_t method, std::span<const std::byte> input,
    std::span<std::byte> output) {
  const auto driver = driverOf(connection);
  if (!driver) return {kDriverFailed, 0};
  return driver->callStructMethod(method, input, output);
}

DriverStatus HostDeviceRegistry::DrvCallMethod(DriverConnection connection, std::uint32_t method,
                                               std::span<const std::uint64_t> input,
                                               std::span<std::uint64_t> output) {
  const auto driver = driverOf(connection);
  return driver ? driver->callScalarMethod(method, input, output) : kDriverFailed;
}

}  // namespace platform::host
