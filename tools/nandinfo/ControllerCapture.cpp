// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/nandinfo/ControllerCapture.h"

#include <sha2.h>

#include <algorithm>
#include <array>
#include <set>

#include "NANDInfo/EAN.h"
#include "base/Text.h"
#include "host/device/DescribedDriver.h"
#include "platform/DeviceRegistry.h"

namespace nandinfo {

using NANDInfo::DriverService;
using Failure = NANDInfo::TunnelAnswer::Failure;
using NANDInfo::nand_exporter_t;
using platform::DriverStatus;
using plist::Array;
using plist::Dictionary;
using plist::Value;

// The buffers of one kind: a command for each argument from 0 on.
struct ControllerCapture::BufferKind {
  const char* name;  // also the beginning of its files' names
  NANDInfo::SelectorGetter nand_exporter_t::*selectors;
  ArgumentIn argumentIn;
  std::uint32_t arguments;
};

// A year of the magazine: no controller keeps more, and each hour that is asked for is a command.
constexpr std::uint32_t kHours = 366 * 24 + 1;

const ControllerCapture::BufferKind ControllerCapture::kKinds[] = {
    {"statistics", &nand_exporter_t::getStatsSelectors, ArgumentIn::word, 1},
    {"read-statistics", &nand_exporter_t::getReadStatsSelectors, ArgumentIn::word, kHours},
    {"msp", &nand_exporter_t::getMSPStatsSelectors, ArgumentIn::word, 10},
    {"defects", &nand_exporter_t::getDefectsListSelectors, ArgumentIn::flags, 1},
    {"telemetry", &nand_exporter_t::getTelemetryListSelectors, ArgumentIn::flags, 3},
    {"task-scheduler", &nand_exporter_t::getTaskSchedulerSelectors, ArgumentIn::flags, 1},
    {"snapshot", &nand_exporter_t::getSnapshotSelectors, ArgumentIn::flags, 1},
    {"snapshot-header", &nand_exporter_t::getSnapshotHeaderSelectors, ArgumentIn::flags, 1},
    {"band-statistics", &nand_exporter_t::getBandStatsSelectors, ArgumentIn::flags, 1},
};

namespace {

std::string sha256(std::string_view bytes) {
  std::array<char, SHA256_DIGEST_STRING_LENGTH> text{};
  SHA256Data(reinterpret_cast<const std::uint8_t*>(bytes.data()), bytes.size(), text.data());
  return text.data();
}

std::string statusText(DriverStatus status) {
  return base::format("the driver answers with status 0x%x", status);
}

}  // namespace

base::Result<void> ControllerCapture::run() {
  // The library takes the first controller that can be opened, and at some places the first one.
  for (const auto* row = NANDInfo::nand_exporters_tunnel;
       row->className != nullptr && exporter_ == nullptr; ++row) {
    auto service = DriverService::matching(services_, row->className);
    if (!service.isPresent()) continue;
    if (auto done = captureController(*row, std::move(service), true); !done) return done;
  }
  // Where none is registered, it takes the first one of a walk.
  for (const auto* row = NANDInfo::nand_exporters_tunnel;
       row->className != nullptr && entries.empty(); ++row) {
    auto service = DriverService::walkedTo(services_, row->className);
    if (!service.isPresent()) continue;
    if (auto done = captureController(*row, std::move(service), false); !done) return done;
  }
  if (entries.empty()) return base::Error{"no storage controller found"};
  if (exporter_ == nullptr) return base::Error{"no storage controller can be opened"};
  captureEAN();
  captureNVRAM();
  return {};
}

base::Result<void> ControllerCapture::captureController(const nand_exporter_t& exporter,
                                                        DriverService service, bool registered) {
  Dictionary entry{{"Class", exporter.className}}, driver;
  if (!registered) entry.set("Registered", false);
  if (service.open() != 0 || !service.isOpen()) {
    leaveOut(exporter.className, "it can't be opened");
    driver.set("RefuseOpen", true);
  } else {
    exporter_ = &exporter;
    className = exporter.className;
    for (const BufferKind& kind : kKinds) {
      if (auto done = captureBuffers(service, kind); !done) return done;
    }
    driver.set("Buffers", std::move(answers_));
    captureRecommendation(service, driver);
    captureCharacteristics(service, entry);
    if (service.close() != 0) driver.set("FailClose", true);
  }
  entry.set("Driver", std::move(driver));
  entries.push_back(std::move(entry));
  return {};
}

base::Result<void> ControllerCapture::captureBuffers(const DriverService& service,
                                                     const BufferKind& kind) {
  const NANDInfo::SelectorGetter getter = exporter_->*kind.selectors;
  const NANDInfo::SelectorPair* selectors = getter != nullptr ? getter() : nullptr;
  if (selectors == nullptr) {
    leaveOut(kind.name, "the driver has no such command");
    return {};
  }
  for (std::uint32_t argument = 0; argument < kind.arguments; ++argument) {
    invocation_.progress(base::format("%s %u", kind.name, argument));
    if (auto done = captureBuffer(service, kind, *selectors, argument); !done) return done;
  }
  return {};
}

base::Result<void> ControllerCapture::captureBuffer(const DriverService& service,
                                                    const BufferKind& kind,
                                                    const NANDInfo::SelectorPair& selectors,
                                                    std::uint32_t argument) {
  const std::string key = base::format("%u:%u", selectors.dataOpType, argument);
  const bool inFlags = kind.argumentIn == ArgumentIn::flags;
  const NANDInfo::TunnelAnswer fetched =
      service.exchange({.sizeMethod = exporter_->sizeSelector,
                        .dataMethod = exporter_->dataSelector,
                        .opTypes = selectors,
                        .flags = inFlags ? argument << NANDInfo::kListArgumentShift : 0,
                        .argument = inFlags ? 0 : argument});
  if (fetched.failure == Failure::size) {
    leaveOut(kind, argument, statusText(fetched.status));
    // What nothing is known of fails like that.
    if (fetched.status != host::kNotSupported) {
      answers_.set(key, Dictionary{{"FailSize", std::uint64_t{fetched.status}}});
    }
    return {};
  }
  Dictionary answer{{"Announce", std::uint64_t{fetched.announced}}};
  if (fetched.failure != Failure::none) {
    const bool tooLarge = fetched.failure == Failure::memory;
    leaveOut(
        kind, argument,
        tooLarge ? "the driver announces more than a buffer may have" : statusText(fetched.status));
    if (!tooLarge) answer.set("FailData", std::uint64_t{fetched.status});
    answers_.set(key, std::move(answer));
    return {};
  }
  const std::string_view bytes(reinterpret_cast<const char*>(fetched.delivered().data()),
                               fetched.delivered().size());
  const std::string digest = sha256(bytes);
  std::string& file = files_[digest];
  if (file.empty()) {
    file = base::format("%s-%u.bin", kind.name, argument);
    if (auto done = folder_.write(file, bytes); !done) return done;
  }
  buffers.push_back(Dictionary{{"name", kind.name},
                               {"opType", std::uint64_t{selectors.dataOpType}},
                               {"argument", std::uint64_t{argument}},
                               {"size", std::uint64_t{bytes.size()}},
                               {"file", file},
                               {"sha256", digest}});
  answer.set("File", file);
  answers_.set(key, bytes.size() == fetched.announced ? Value(file) : Value(std::move(answer)));
  return {};
}

void ControllerCapture::captureRecommendation(const DriverService& service, Dictionary& driver) {
  if (exporter_->recommendDeletionSelector == NANDInfo::kNoSelector) return;
  std::array<std::byte, 4> output{};
  const auto answer = service.call(exporter_->recommendDeletionSelector, output);
  if (answer.status != 0) return leaveOut("deletion recommendation", statusText(answer.status));
  plist::Data bytes;
  for (std::size_t i = 0; i < std::min(output.size(), answer.outputSize); ++i) {
    bytes.push_back(std::to_integer<std::uint8_t>(output[i]));
  }
  driver.set("RecommendsDeletion", std::move(bytes));
}

void ControllerCapture::captureCharacteristics(const DriverService& service, Dictionary& entry) {
  // Those that a command reads. What else an entry tells of itself may identify it.
  constexpr std::string_view kRead[] = {"chip-id", "manufacturer-id", "num-bus",
                                        "nand-device-desc"};
  auto found =
      service.property(exporter_->propertyKey, platform::DeviceRegistry::Direction::parents);
  if (!found) return leaveOut(exporter_->propertyKey, "the registry has no such property");
  if (invocation_.arguments.redact) {
    Dictionary kept;
    const auto* all = found->as<Dictionary>();
    for (const std::string_view key : kRead) {
      if (const Value* value = all != nullptr ? all->find(key) : nullptr) kept.set(key, *value);
    }
    // One that isn't a dictionary stays none.
    found = all != nullptr ? Value(std::move(kept)) : Value("");
  }
  entry.set("Properties", Dictionary{{exporter_->propertyKey, *std::move(found)}});
}

void ControllerCapture::captureEAN() {
  constexpr std::uint32_t kMethods[] = {NANDInfo::kEANImageSizeMethod,
                                        NANDInfo::kEANUpdateCountMethod};
  auto service = DriverService::matching(services_, NANDInfo::kEANClassName);
  if (!service.isPresent()) return leaveOut(NANDInfo::kEANClassName, "the registry has none");
  Dictionary driver;
  if (const DriverStatus refused = service.open(); refused != 0) {
    leaveOut(NANDInfo::kEANClassName, statusText(refused));
    driver.set("RefuseOpen", true);
  } else {
    std::set<std::uint32_t> codes;
    for (const NANDInfo::EANQuery& query : NANDInfo::EANQueries()) codes.insert(query.code);
    Dictionary scalars;
    for (const std::uint32_t method : kMethods) {
      for (const std::uint32_t code : codes) {
        std::string key = base::format("%u:", method);
        for (int shift = 24; shift >= 0; shift -= 8) key += static_cast<char>(code >> shift & 0xFF);
        const std::uint64_t input[] = {code};
        std::uint64_t output[] = {0};
        const auto status = service.call(method, input, output);
        if (status == 0) {
          scalars.set(key, output[0]);
        } else {
          leaveOut(NANDInfo::kEANClassName + (" " + key), statusText(status));
        }
      }
    }
    driver.set("Scalars", std::move(scalars));
  }
  entries.push_back(Dictionary{{"Class", NANDInfo::kEANClassName}, {"Driver", std::move(driver)}});
}

void ControllerCapture::captureNVRAM() {
  constexpr char kClass[] = "NvramDiagService";
  const auto service = DriverService::matching(services_, kClass);
  if (!service.isPresent()) return leaveOut(kClass, "the registry has none");
  Dictionary properties;
  for (const char* const key : {"CommonUsed", "SystemUsed", "Generation", "Version"}) {
    if (auto value = service.property(key, platform::DeviceRegistry::Direction::children)) {
      properties.set(key, *std::move(value));
    }
  }
  entries.push_back(Dictionary{{"Class", kClass}, {"Properties", std::move(properties)}});
}

void ControllerCapture::leaveOut(std::string what, std::string reason) {
  kindLeftOut_ = nullptr;
  leftOut.push_back(Dictionary{{"what", std::move(what)}, {"reason", std::move(reason)}});
}

// Arguments that follow each other and fail alike are one entry.
void ControllerCapture::leaveOut(const BufferKind& kind, std::uint32_t argument,
                                 std::string reason) {
  if (kindLeftOut_ == &kind && lastLeftOut_ + 1 == argument &&
      *leftOut.back().as<Dictionary>()->text("reason") == reason) {
    leftOut.pop_back();
  } else {
    firstLeftOut_ = argument;
  }
  lastLeftOut_ = argument;
  leaveOut(firstLeftOut_ == argument
               ? base::format("%s %u", kind.name, argument)
               : base::format("%s %u to %u", kind.name, firstLeftOut_, argument),
           std::move(reason));
  kindLeftOut_ = &kind;
}

}  // namespace nandinfo
