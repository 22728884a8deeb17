// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/nandinfo/Capture.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstddef>
#include <initializer_list>
#include <string_view>
#include <utility>
#include <vector>

#include "NANDInfo/Events.h"
#include "NANDInfo/NANDInfo.h"
#include "platform/Clock.h"
#include "platform/DeviceProperties.h"
#include "platform/Eventra.h"
#include "platform/FileSystem.h"
#include "platform/Kernel.h"
#include "platform/KernelSnapshots.h"
#include "platform/PurgeableSpace.h"
#include "plist/JSON.h"
#include "plist/PropertyList.h"
#include "tools/nandinfo/CaptureFolder.h"
#include "tools/nandinfo/ControllerCapture.h"

namespace nandinfo {

namespace {

using plist::Array;
using plist::Dictionary;
using plist::Value;

constexpr char kBootSession[] = "kern.bootsessionuuid";

Dictionary withoutMissing(
    std::initializer_list<std::pair<const char*, std::optional<std::int64_t>>> figures) {
  Dictionary known;
  for (const auto& [key, figure] : figures) {
    if (figure) known.set(key, *figure);
  }
  return known;
}

class Capture {
 public:
  explicit Capture(const Invocation& invocation)
      : invocation_(invocation), services_(invocation.services) {}

  CommandResult run() {
    if (const auto captured = capture(); !captured) return captured.error();
    folder_.finish();
    return std::move(manifest_);
  }

 private:
  base::Result<void> capture() {
    if (auto done = folder_.open(invocation_.arguments.folder); !done) return done;
    ControllerCapture controller(invocation_, folder_);
    if (auto done = controller.run(); !done) return done;
    const std::pair<const char*, std::optional<Value>> files[] = {
        {"properties.plist", properties()},
        {"system-version.plist", services_.systemVersion.systemVersionDictionary()},
        {"kernel.plist", kernelValues()},
        {"purgeable-space.plist", purgeableSpace()},
        {"analytics.plist", analytics()},
        {"registry.plist",
         Dictionary{{"Class", "Root"}, {"Children", std::move(controller.entries)}}},
    };
    for (const auto& [name, content] : files) {
      if (!content) continue;
      const auto bytes = plist::writeXML(*content);
      if (!bytes) return bytes.error().at(invocation_.arguments.folder + "/" + name);
      if (auto done = folder_.write(name, *bytes); !done) return done;
    }
    if (const auto snapshot =
            services_.snapshots.capture(platform::KernelSnapshots::kChunkedData)) {
      const std::string_view bytes(reinterpret_cast<const char*>(snapshot->data()),
                                   snapshot->size());
      if (auto done = folder_.write("kernel-snapshot.bin", bytes); !done) return done;
    }
    manifest_ = Dictionary{{"tool", "nandinfo " MORVEND_VERSION},
                           {"time", services_.clock.now()},
                           {"class", controller.className},
                           {"redacted", invocation_.arguments.redact},
                           {"buffers", std::move(controller.buffers)},
                           {"leftOut", std::move(controller.leftOut)}};
    std::string json;
    plist::appendIndentedJSON(json, manifest_);
    return folder_.write("manifest.json", json + '\n');
  }

  // What the commands read beside the controller; none of what the device has no answer for.

  Value properties() {
    auto& device = services_.deviceProperties;
    Dictionary properties;
    for (const char* const key : {"HardwareModel", "SystemIdentifier", "InverseDeviceID"}) {
      const bool identifies = std::string_view(key) != "HardwareModel";
      if (identifies && invocation_.arguments.redact) continue;
      if (auto text = device.textProperty(key)) properties.set(key, *std::move(text));
    }
    if (const auto usage = device.diskUsage()) {
      properties.set("DiskUsage",
                     withoutMissing({{"TotalDiskCapacity", usage->totalDiskCapacity},
                                     {"TotalDataAvailable", usage->totalDataAvailable},
                                     {"AmountDataAvailable", usage->amountDataAvailable}}));
    }
    if (const auto volume = services_.files.statfs("/private/var")) {
      properties.set("FileSystem", Dictionary{{"BlockSize", volume->blockSize},
                                              {"Blocks", volume->blocks},
                                              {"BlocksAvailable", volume->blocksAvailable}});
    }
    return properties;
  }

  // The commands look at the boot session's first digit.
  std::optional<Value> kernelValues() {
    std::array<std::byte, 100> buffer{};
    const auto read = services_.kernel.sysctlbyname(kBootSession, buffer);
    if (read.error == ENOENT) return std::nullopt;
    if (read.error != 0) {
      return Dictionary{{kBootSession, Dictionary{{"Error", std::int64_t{read.error}}}}};
    }
    plist::Data session;
    for (const std::byte byte : std::span(buffer).first(std::min(read.length, buffer.size()))) {
      const bool kept = session.empty() || !invocation_.arguments.redact;
      session.push_back(kept ? std::to_integer<std::uint8_t>(byte) : 0);
    }
    return Dictionary{{kBootSession, std::move(session)}};
  }

  std::optional<Value> purgeableSpace() {
    if (!services_.purgeableSpace.isPresent()) return std::nullopt;
    const auto answer = services_.purgeableSpace.SpacereapCopyItemizedPurgeableSpaceWithInfo(
        {{"SPACEREAP_VOLUME", "/private/var"}});
    // Anything but a dictionary is a service that doesn't answer.
    return answer ? Value(*answer) : Value(Array{});
  }

  // Which of the library's events are used; none when all of them are.
  std::optional<Value> analytics() {
    if (!services_.eventra.offersLazySend()) return Dictionary{{"Available", false}};
    std::vector<std::string_view> events;
    for (const NANDInfo::EventView& event : NANDInfo::eventViews()) events.push_back(event.event);
    events.push_back(NANDInfo::kEventName_massStorage_NANDInfo_NORWrites);
    Array used;
    for (const std::string_view event : events) {
      if (services_.eventra.EventraIsEventUsed(event)) used.push_back(event);
    }
    if (used.size() == events.size()) return std::nullopt;
    return Dictionary{{"UsedEvents", std::move(used)}};
  }

  const Invocation& invocation_;
  const NANDInfo::Services services_;
  CaptureFolder folder_;
  Value manifest_ = Dictionary();
};

}  // namespace

CommandResult capture(const Invocation& invocation) { return Capture(invocation).run(); }

}  // namespace nandinfo
