// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Bytes as the registry file, and then every question to every entry and driver.
#include <span>
#include <vector>

#include "Input.h"
#include "MemoryFolder.h"
#include "base/ByteWriter.h"
#include "host/recorded/DeviceRegistry.h"
#include "plist/PropertyList.h"

namespace {

using namespace platform;

using fuzz::require;
using host::recorded::DeviceRegistry;

constexpr std::size_t kMaxEntries = 200, kMaxOutput = 256;

// A root in memory, with one file for drivers to answer from and one outside device/.
struct Folder : fuzz::MemoryFolder {
  Folder() : MemoryFolder("device") {
    fuzz::writeFile(path / "device/buffer", "below device/");
    fuzz::writeFile(path / "outside", "OUTSIDE");
  }
};

// The number of lines, and whether one is about handles.
class CountingLog : public SystemLog {
 public:
  CountingLog() : SystemLog(LogLevel::debug) {}
  int lines = 0;
  bool handlesWereLost = false;

 private:
  void write(LogLevel, std::string_view, std::string_view message) override {
    ++lines;
    handlesWereLost |= message.ends_with(" driver handles were not released");
  }
};

void put(std::span<std::byte> block, std::size_t offset, std::uint32_t word) {
  std::ranges::copy(base::littleEndianBytes(word), block.subspan(offset).begin());
}

// One struct call: nothing is written behind what the call says that it delivered.
void callStruct(host::recorded::DeviceRegistry& registry, DriverConnection connection,
                std::uint32_t method, std::span<const std::byte> block, std::size_t capacity) {
  constexpr std::byte kUntouched{0xA5};
  std::vector<std::byte> output(capacity, kUntouched);
  const auto result = registry.DrvCallStructMethod(connection, method, block, output);
  require(result.outputSize <= capacity, "no more is delivered than there is room");
  require(result.status == 0 || result.outputSize == 0, "a failed call delivers nothing");
  require(std::all_of(output.begin() + static_cast<std::ptrdiff_t>(result.outputSize), output.end(),
                      [](std::byte byte) { return byte == kUntouched; }),
          "what isn't delivered isn't written");
  const std::string_view text(reinterpret_cast<const char*>(output.data()), result.outputSize);
  require(text != "OUTSIDE", "no file outside device/ is read");
}

void askDriver(host::recorded::DeviceRegistry& registry, DriverConnection connection) {
  std::byte block[24]{};
  for (const std::uint32_t opType : {10u, 11u, 13u, 15u, 17u, 22u, 39u, 145u, 221u}) {
    for (const std::uint32_t argument : {0u, 1u, 24u, 1u << 31}) {
      for (const std::uint32_t flags : {0u, 1u, 4u, 5u}) {
        put(block, 0, opType), put(block, 4, flags), put(block, 8, argument);
        callStruct(registry, connection, 8 + flags % 2, block, flags % 2 == 1 ? 4 : kMaxOutput);
      }
    }
  }
  for (const std::size_t capacity : {0u, 1u, 4u}) callStruct(registry, connection, 5, {}, capacity);
  callStruct(registry, connection, 9, std::span(block).first(23), 4);
  for (const std::uint64_t code : {0x64424943ull, 0ull, ~0ull}) {
    std::uint64_t output[2] = {1, 2};
    const auto status = registry.DrvCallMethod(connection, 3, {&code, 1}, output);
    require(status == 0 || output[0] == 1, "a failed call writes nothing");
    require(output[1] == 2, "there is one output scalar");
  }
}

// Every handle that was handed out is given back.
void askEverything(host::recorded::DeviceRegistry& registry) {
  const RegistryObject root = registry.rootEntry(), iterator = registry.createIterator();
  require((root == 0) == (iterator == 0), "a root and a walk, or neither");
  std::size_t entries = 0;
  while (const RegistryObject entry = registry.next(iterator)) {
    for (const auto direction :
         {DeviceRegistry::Direction::parents, DeviceRegistry::Direction::children}) {
      registry.searchProperty(entry, "name", direction);
    }
    const auto [status, connection] = registry.DrvServiceOpen(entry, 0);
    require((status == 0) == (connection != 0), "a connection, or an error");
    if (connection != 0 && ++entries <= kMaxEntries) askDriver(registry, connection);
    registry.DrvServiceClose(connection);
    require(registry.DrvServiceClose(connection) != 0, "a closed connection is gone");
    registry.release(entry);
    require(!registry.conformsTo(entry, "Disk"), "a released entry is gone");
  }
  for (const char* className : {"Controller", "Disk", ""}) {
    const RegistryObject service = registry.DrvGetMatchingService(className);
    require(service == 0 || registry.conformsTo(service, className), "a match conforms");
    registry.release(service);
  }
  for (const RegistryObject object : {root, iterator, root, 0u, 77u}) registry.release(object);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  static const Folder folder;
  static const host::DeviceRoot root(folder.path.string());
  fuzz::writeFile(folder.path / "device/registry.plist",
                  {reinterpret_cast<const char*>(bytes), size});
  CountingLog log;
  {
    host::recorded::DeviceRegistry registry(root, log);
    askEverything(registry);
    const int lines = log.lines;
    askEverything(registry);
    require(log.lines == lines, "what is wrong is said once");
  }
  require(!log.handlesWereLost, "every handle is counted");
  return 0;
}
