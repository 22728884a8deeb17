// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/machine/DriveRegistry.h"

#include <string>
#include <utility>

#include "base/UTF8.h"
#include "host/machine/DriveFigures.h"
#include "host/machine/Drives.h"
#include "platform/DeviceRegistry.h"

namespace host::machine {

namespace {

constexpr char kStatisticsCommand[] = "13";

plist::Dictionary descriptionOf(const Drive& drive) {
  plist::Dictionary description{{"name", drive.name}, {"kind", drive.kind}};
  const auto add = [&description](const char* key, const std::string& text) {
    std::string room;
    if (!text.empty()) description.set(key, base::writable(text, room));
  };
  add("model", drive.model);
  add("serial", drive.serial);
  add("firmware", drive.firmware);
  if (drive.capacity != 0) description.set("capacity", drive.capacity);
  description.set("holdsRoot", drive.holdsRoot);
  plist::Dictionary figures;
  for (const auto& [name, value] : drive.figures) figures.set(name, value);
  if (!figures.empty()) description.set("figures", std::move(figures));
  add("unknown", drive.unknown);
  return description;
}

plist::Dictionary entryOf(const Drive& drive) {
  plist::Dictionary entry{
      {"Class", drive.isFlash ? "ZMCStorage" : "Disk"},
      {"Properties", plist::Dictionary{{platform::kRegistryDriveKey, descriptionOf(drive)}}}};
  if (!drive.isFlash) return entry;
  plist::Dictionary answers;
  if (auto statistics = statisticsOf(drive.figures); !statistics.empty()) {
    answers.set("Buffers", plist::Dictionary{{kStatisticsCommand, std::move(statistics)}});
  }
  entry.set("Driver", std::move(answers));
  return entry;
}

}  // namespace

const plist::Dictionary* DriveRegistry::tree() {
  plist::Array entries;
  for (const Drive& drive : findDrives(machine_, mountOf(root_))) {
    if (!drive.unknown.empty()) {
      log_.log(platform::LogLevel::standard, "The health of %s isn't known: %s", drive.name.c_str(),
               drive.unknown.c_str());
    }
    entries.push_back(entryOf(drive));
  }
  tree_.set("Children", std::move(entries));
  return &tree_;
}

}  // namespace host::machine
