#include "tools/nandinfo/Capture.h"

#include <sha2.h>
#include <unistd.h>

#include <array>
#include <string_view>
#include <vector>

#include "NANDInfo/DriverHandles.h"
#include "NANDInfo/NANDInfo.h"
#include "platform/Text.h"
#include "platform/host/JSON.h"
#include "tools/nandinfo/CaptureFolder.h"

namespace nandinfo {

namespace {

using NANDInfo::nand_exporter_t;
using platform::Array;
using platform::Dictionary;
using platform::Platform;
using platform::Value;

// The buffers of one kind: a command for each argument.
struct BufferKind {
  const char* name;  // also the beginning of its files' names
  NANDInfo::SelectorGetter nand_exporter_t::*selectors;
  std::span<const std::uint32_t> arguments;
  bool endsAtFailure;  // the arguments are indices, counted up until one isn't answered
};

constexpr std::uint32_t kZero[] = {0};
constexpr std::uint32_t kHours[] = {0, 4, 8, 12, 16, 20, 24, 168, 720};
constexpr std::uint32_t kMSPs[] = {0, 1, 2, 3, 4, 5, 6, 7, 8, 9};
constexpr std::uint32_t kTelemetryLists[] = {0, 1, 2};

constexpr BufferKind kKinds[] = {
    {"statistics", &nand_exporter_t::getStatsSelectors, kZero, false},
    {"read-statistics", &nand_exporter_t::getReadStatsSelectors, kHours, false},
    {"msp", &nand_exporter_t::getMSPStatsSelectors, kMSPs, true},
    {"defects", &nand_exporter_t::getDefectsListSelectors, kZero, false},
    {"telemetry", &nand_exporter_t::getTelemetryListSelectors, kTelemetryLists, false},
    {"task-scheduler", &nand_exporter_t::getTaskSchedulerSelectors, kZero, false},
    {"snapshot", &nand_exporter_t::getSnapshotSelectors, kZero, false},
    {"snapshot-header", &nand_exporter_t::getSnapshotHeaderSelectors, kZero, false},
    {"band-statistics", &nand_exporter_t::getBandStatsSelectors, kZero, false},
};

// The EAN service's scalar methods.
constexpr std::uint32_t kEANImageSizeMethod = 3, kEANUpdateCountMethod = 7;

std::string sha256(std::string_view bytes) {
  std::array<char, SHA256_DIGEST_STRING_LENGTH> text{};
  SHA256Data(reinterpret_cast<const std::uint8_t*>(bytes.data()), bytes.size(), text.data());
  return text.data();
}

std::string hostName() {
  std::array<char, 256> name{};
  return ::gethostname(name.data(), name.size() - 1) == 0 ? name.data() : "";
}

std::string lettersOf(std::uint32_t code) {
  std::string letters;
  for (int shift = 24; shift >= 0; shift -= 8) letters += static_cast<char>(code >> shift & 0xff);
  return letters;
}

// One capture, through the open connection of an exporter.
class Capture {
 public:
  Capture(const Invocation& invocation, const nand_exporter_t& exporter)
      : invocation_(invocation), platform_(invocation.platform), exporter_(exporter) {}

  CommandResult run() {
    const std::string& path = invocation_.arguments.folder;
    if (const std::string error = folder_.open(path); !error.empty()) {
      return CommandResult::failure(error);
    }
    for (const BufferKind& kind : kKinds) {
      if (const std::string error = fetch(kind); !error.empty()) {
        return CommandResult::failure(error);
      }
    }
    const auto registry = platform_.propertyLists.writeXML(
        Dictionary{{"Class", "Root"}, {"Children", registryEntries()}});
    if (!registry) return CommandResult::failure(path + "/registry.plist: " + registry.error);
    Value manifest = Dictionary{{"tool", "nandinfo " MORVEND_VERSION},
                                {"time", platform_.clock.now()},
                                {"host", hostName()},
                                {"class", exporter_.className},
                                {"buffers", std::move(captured_)},
                                {"leftOut", std::move(leftOut_)}};
    std::string json;
    platform::host::appendIndentedJSON(json, manifest);
    for (const auto& [name, bytes] :
         {std::pair("registry.plist", *registry), std::pair("manifest.json", json + '\n')}) {
      if (const std::string error = folder_.write(name, bytes); !error.empty()) {
        return CommandResult::failure(error);
      }
    }
    folder_.finish();
    return CommandResult::success(std::move(manifest));
  }

 private:
  void leaveOut(std::string what, std::string reason) {
    leftOut_.push_back(Dictionary{{"what", std::move(what)}, {"reason", std::move(reason)}});
  }

  // The empty text, or what couldn't be written.
  std::string fetch(const BufferKind& kind) {
    const NANDInfo::SelectorGetter getter = exporter_.*kind.selectors;
    const NANDInfo::SelectorPair* selectors = getter != nullptr ? getter() : nullptr;
    if (selectors == nullptr) {
      leaveOut(kind.name, "the driver has no such command");
      return {};
    }
    for (const std::uint32_t argument : kind.arguments) {
      const std::string what = platform::format("%s %u", kind.name, argument);
      invocation_.progress(what);
      NANDInfo::TunnelCommandBlock block{.argument = argument};
      NANDInfo::Buffer buffer;
      if (!NANDInfo::executeTunnelCommand(platform_, exporter_.io_connection, &exporter_, selectors,
                                          block, buffer)) {
        leaveOut(what, "the driver refused the command");
        if (kind.endsAtFailure) return {};
        continue;
      }
      const std::string_view bytes(reinterpret_cast<const char*>(buffer.data()), buffer.size());
      const std::string file = platform::format("%s-%u.bin", kind.name, argument);
      if (std::string error = folder_.write(file, bytes); !error.empty()) return error;
      buffers_.set(platform::format("%u:%u", selectors->dataOpType, argument), file);
      captured_.push_back(Dictionary{{"name", kind.name},
                                     {"opType", std::uint64_t{selectors->dataOpType}},
                                     {"argument", std::uint64_t{argument}},
                                     {"size", std::uint64_t{bytes.size()}},
                                     {"file", file},
                                     {"sha256", sha256(bytes)}});
    }
    return {};
  }

  Array registryEntries() {
    Dictionary driver{{"Buffers", std::move(buffers_)}};
    captureRecommendation(driver);
    Dictionary controller{{"Class", exporter_.className}};
    if (auto characteristics =
            platform_.registry.searchProperty(exporter_.service, exporter_.propertyKey,
                                              platform::DeviceRegistry::Direction::parents)) {
      controller.set("Properties",
                     Dictionary{{exporter_.propertyKey, *std::move(characteristics)}});
    } else {
      leaveOut(exporter_.propertyKey, "the registry has no such property");
    }
    controller.set("Driver", std::move(driver));
    Array entries{std::move(controller)};
    captureEAN(entries);
    return entries;
  }

  void captureRecommendation(Dictionary& driver) {
    if (exporter_.recommendDeletionSelector == NANDInfo::kNoSelector) return;
    std::array<std::byte, 4> output{};
    const auto answer = platform_.drivers.DrvCallStructMethod(
        exporter_.io_connection, exporter_.recommendDeletionSelector, {}, output);
    if (answer.status != 0) {
      return leaveOut("deletion recommendation", statusText(answer.status));
    }
    platform::Data bytes;
    for (std::size_t i = 0; i < std::min(output.size(), answer.outputSize); ++i) {
      bytes.push_back(std::to_integer<std::uint8_t>(output[i]));
    }
    driver.set("RecommendsDeletion", std::move(bytes));
  }

  void captureEAN(Array& entries) {
    constexpr char kName[] = "EAN service";
    const NANDInfo::RegistryHandle service(
        platform_, platform_.registry.DrvGetMatchingService(NANDInfo::kEANClassName));
    if (service.get() == 0) return leaveOut(kName, "the registry has no such service");
    const NANDInfo::DriverHandle connection(platform_, service.get());
    if (connection.status() != 0) return leaveOut(kName, statusText(connection.status()));
    Dictionary scalars;
    for (const NANDInfo::EANQuery& query : NANDInfo::EANQueries()) {
      const std::uint32_t method =
          query.query == NANDInfo::GetEANImageSize ? kEANImageSizeMethod : kEANUpdateCountMethod;
      const std::string key = platform::format("%u:%s", method, lettersOf(query.code).c_str());
      const std::uint64_t input[] = {query.code};
      std::uint64_t output[] = {0};
      const auto status = platform_.drivers.DrvCallMethod(connection.get(), method, input, output);
      if (status == 0) {
        scalars.set(key, output[0]);
      } else {
        leaveOut(kName + (" " + key), statusText(status));
      }
    }
    entries.push_back(Dictionary{{"Class", NANDInfo::kEANClassName},
                                 {"Driver", Dictionary{{"Scalars", std::move(scalars)}}}});
  }

  static std::string statusText(platform::DriverStatus status) {
    return platform::format("the driver answers with status 0x%x", status);
  }

  const Invocation& invocation_;
  Platform& platform_;
  const nand_exporter_t& exporter_;
  CaptureFolder folder_;
  Dictionary buffers_;        // the driver's, by op type and argument
  Array captured_, leftOut_;  // of the manifest
};

}  // namespace

CommandResult capture(const Invocation& invocation) {
  nand_exporter_t* exporter = nullptr;
  if (!NANDInfo::findNandExporterNew(invocation.platform, exporter)) {
    return CommandResult::failure("no storage controller can be opened");
  }
  CommandResult result = Capture(invocation, *exporter).run();
  NANDInfo::ReleaseIOInterfaces(invocation.platform, exporter);
  return result;
}

}  // namespace nandinfo
