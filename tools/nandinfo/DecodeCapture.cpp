// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/nandinfo/DecodeCapture.h"

#include <algorithm>
#include <charconv>
#include <optional>
#include <string>
#include <string_view>
#include <system_error>

#include "NANDInfo/NANDInfo.h"
#include "NANDInfo/TelemetryList.h"
#include "NANDInfo/queries/DecodedBuffer.h"
#include "base/Text.h"
#include "host/files/DeviceRoot.h"
#include "platform/StandardStreams.h"
#include "plist/PropertyList.h"

namespace nandinfo {

namespace {

using base::Error;
using NANDInfo::Bytes;
using NANDInfo::CounterLayout;
using plist::Array;
using plist::Dictionary;
using plist::Value;

struct CapturedController {
  const char* className;
  const char* propertyKey;
  const Dictionary* entry;
};

bool isOfClass(const Dictionary& entry, std::string_view className) {
  const std::string* own = entry.text("Class");
  return own != nullptr && *own == className;
}

// The first entry of a class with a driver that answers anything, parents before children. The
// depth is that of a property list, which is limited.
const Dictionary* findEntry(const Dictionary& entry, std::string_view className) {
  const Dictionary* driver = entry.dictionary("Driver");
  if (isOfClass(entry, className) && driver != nullptr &&
      driver->dictionary("Buffers") != nullptr) {
    return &entry;
  }
  if (const Array* children = entry.array("Children")) {
    for (const Value& child : *children) {
      const auto* below = child.as<Dictionary>();
      if (below == nullptr) continue;
      if (const Dictionary* found = findEntry(*below, className)) return found;
    }
  }
  return nullptr;
}

std::optional<CapturedController> findController(const Dictionary& registry) {
  for (std::size_t i = 0; i < NANDInfo::kExporters; ++i) {
    const auto& exporter = NANDInfo::nand_exporters_tunnel[i];
    if (const Dictionary* entry = findEntry(registry, exporter.className)) {
      return CapturedController{exporter.className, exporter.propertyKey, entry};
    }
  }
  return std::nullopt;
}

// What tells how a telemetry list is read.
struct Characteristics {
  const CounterLayout* layout;
  std::uint32_t channels;  // 0 if it isn't known
};

Characteristics characteristicsOf(const NANDInfo::Services& services,
                                  const CapturedController& controller) {
  static const Dictionary kNone;
  const Dictionary* properties = controller.entry->dictionary("Properties");
  const Dictionary* device =
      properties != nullptr ? properties->dictionary(controller.propertyKey) : nullptr;
  if (device == nullptr) device = &kNone;
  const std::string *chip = device->text("chip-id"), *vendor = device->text("manufacturer-id");
  const auto maker = vendor != nullptr ? NANDInfo::vendorOf(*vendor) : NANDInfo::Vendor();
  services.streams.writeOutput(maker.complaint);
  auto* const convert =
      NANDInfo::counterConverter(NANDInfo::chipKind(chip != nullptr ? *chip : ""), maker.code);
  const auto layouts = NANDInfo::counterLayouts();
  const auto layout = std::find_if(layouts.begin(), layouts.end(),
                                   [&](const CounterLayout& row) { return row.parse == convert; });
  const plist::Number* channels = device->number("num-bus");
  const std::int64_t count = channels != nullptr ? channels->int64Value() : 0;
  return {&*layout, count > 0 && count < INT32_MAX ? static_cast<std::uint32_t>(count) : 0};
}

// The names of the capture's buffers and what decodes them.
struct OpType {
  std::uint32_t number;
  const char* name;
  Dictionary (*decode)(Bytes bytes);
};
constexpr OpType kOpTypes[] = {
    {13, "statistics", NANDInfo::decodedFTL},
    {10, "read-statistics", NANDInfo::decodedFTL},
    {221, "msp", NANDInfo::decodedMSP},
    {15, "defects", NANDInfo::decodedDefects},
    {17, "telemetry", nullptr},
    {11, "band-statistics", NANDInfo::decodedValidity},
    {39, "task-scheduler", nullptr},
    {22, "snapshot", nullptr},
    {145, "snapshot-header", nullptr},
};
constexpr std::uint32_t kTelemetry = 17;

// The numbers of a buffer's key: "13:0", or "13" for argument 0.
bool parseKey(std::string_view key, std::uint32_t& opType, std::uint32_t& argument) {
  const auto number = [](std::string_view text, std::uint32_t& value) {
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), value);
    return error == std::errc() && end == text.data() + text.size();
  };
  const std::size_t colon = key.find(':');
  argument = 0;
  return number(key.substr(0, colon), opType) &&
         (colon == key.npos || number(key.substr(colon + 1), argument));
}

class Capture {
 public:
  explicit Capture(const Invocation& invocation)
      : services_(invocation.services), folder_(invocation.arguments.folder) {}

  CommandResult decode() {
    if (const auto there = folder_.isThere("the folder"); !there) return there.error();
    constexpr char kRegistry[] = "registry.plist";
    const auto bytes = read(kRegistry);
    if (!bytes) return bytes.error().at(folder_.hostPath(kRegistry));
    const auto registry = plist::read(*bytes);
    if (!registry) return registry.error().at(folder_.hostPath(kRegistry));
    const auto* top = registry->as<Dictionary>();
    const auto controller = top != nullptr ? findController(*top) : std::nullopt;
    if (!controller)
      return Error{"it has no controller with buffers"}.at(folder_.hostPath(kRegistry));
    decoded_ = {{"ok", true}, {"class", controller->className}};
    decodeBuffers(*controller);
    decodeSnapshotOfKernel();
    decoded_.set("undecoded", std::move(undecoded_));
    decoded_.set("ok", why_.empty() && count_ > 0);
    if (why_.empty() && count_ == 0) why_ = "no buffer in it can be decoded";
    decoded_.set("error", why_.empty() ? "NA" : why_);
    if (why_.empty()) return Value(std::move(decoded_));
    return {Value(std::move(decoded_)), Error{why_}.at(folder_.path())};
  }

 private:
  // A file of the capture, as long as all of them together aren't too long.
  base::Result<std::string> read(const std::string& name) {
    auto bytes = folder_.readFile(name, left_ + 1);
    if (!bytes) return bytes;
    if (bytes->size() > left_) return Error{"the capture is longer than 16 MiB"};
    left_ -= bytes->size();
    return bytes;
  }

  // A driver's answer: the bytes, a file, or a dictionary with either; none if it answers a
  // failure.
  std::optional<base::Result<std::string>> answer(const Value& value) {
    const auto* options = value.as<Dictionary>();
    const auto* file = options != nullptr ? options->text("File") : value.as<std::string>();
    const auto* data = options != nullptr ? options->data("Data") : value.as<plist::Data>();
    for (const char* failure : {"FailSize", "FailData"}) {
      const auto* status = options != nullptr ? options->number(failure) : nullptr;
      if (status != nullptr && status->boolValue()) return std::nullopt;
    }
    if (file != nullptr) return read(*file);
    if (data == nullptr) return std::nullopt;
    return std::string(data->begin(), data->end());
  }

  void decodeBuffers(const CapturedController& controller) {
    const Characteristics device = characteristicsOf(services_, controller);
    for (const auto& [key, value] :
         *controller.entry->dictionary("Driver")->dictionary("Buffers")) {
      std::uint32_t opType = 0, argument = 0;
      const auto* row =
          parseKey(key, opType, argument)
              ? std::find_if(std::begin(kOpTypes), std::end(kOpTypes),
                             [&](const OpType& known) { return known.number == opType; })
              : std::end(kOpTypes);
      const std::string name =
          row != std::end(kOpTypes) ? base::format("%s %u", row->name, argument) : "buffer " + key;
      if (row == std::end(kOpTypes) || (row->decode == nullptr && opType != kTelemetry)) {
        undecoded_.push_back(name);
        continue;
      }
      const auto bytes = answer(value);
      if (!bytes) continue;
      if (!*bytes) {
        note(name, bytes->error().text);
      } else if (!(**bytes).empty()) {  // nothing was delivered, and that was the answer
        add(name, opType == kTelemetry
                      ? NANDInfo::decodedTelemetry(spanOf(**bytes), *device.layout, device.channels)
                      : row->decode(spanOf(**bytes)));
      }
    }
  }

  void decodeSnapshotOfKernel() {
    constexpr char kName[] = "kernel-snapshot";
    const std::string file = std::string(kName) + ".bin";
    if (!folder_.openForStatus(file)) return;
    const auto bytes = read(file);
    if (!bytes) return note(kName, bytes.error().text);
    add(kName, NANDInfo::decodedSnapshot(spanOf(*bytes)));
  }

  static Bytes spanOf(const std::string& bytes) { return std::as_bytes(std::span(bytes)); }

  // The first one that fails is the one that is said.
  void note(const std::string& name, const std::string& why) {
    if (why_.empty()) why_ = name + ": " + (why == "NA" ? "nothing in it can be decoded" : why);
  }

  void add(const std::string& name, Dictionary decoded) {
    ++count_;
    if (!decoded.number("ok")->boolValue()) note(name, *decoded.text("error"));
    decoded_.set(name, std::move(decoded));
  }

  const NANDInfo::Services services_;
  const host::DeviceRoot folder_;
  std::size_t left_ = NANDInfo::kMaxBuffer;  // bytes that may still be read
  std::size_t count_ = 0;                    // of decoded buffers
  Dictionary decoded_;
  Array undecoded_;
  std::string why_;  // it failed
};

}  // namespace

CommandResult decodeCapture(const Invocation& invocation) { return Capture(invocation).decode(); }

}  // namespace nandinfo
