// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The registry and its drivers, over one registry file.
#include <gtest/gtest.h>

#include <filesystem>
#include <vector>

#include "HostServices.h"
#include "host/files/DeviceFileSystem.h"
#include "host/recorded/DeviceRegistry.h"
#include "platform/DeviceRegistry.h"
#include "plist/PropertyList.h"

namespace {

using namespace host::recorded;
using namespace host;
using Direction = platform::DeviceRegistry::Direction;

constexpr std::int64_t operator""_i(unsigned long long value) {
  return static_cast<std::int64_t>(value);
}

plist::Dictionary named(const char* className, plist::Array children = {}) {
  return {{"Class", className}, {"Children", std::move(children)}};
}

plist::Data dataOf(std::string_view text) { return {text.begin(), text.end()}; }

// Two controllers behind a bus, a service that only a walk finds, one entry of wrong types.
plist::Dictionary registryFile() {
  plist::Dictionary controller =
      named("Controller", {plist::Dictionary{{"Class", "Namespace"},
                                             {"Conforms", plist::Array{"Disk", 5_i}},
                                             {"Properties", plist::Dictionary{{"depth", 3_i}}}}});
  controller.set("Properties",
                 plist::Dictionary{{"name", "first"}, {"PropertyMatch", plist::Dictionary()}});
  controller.set(
      "Driver",
      plist::Dictionary{
          {"RecommendsDeletion", 0x501020304_i},
          {"Scalars", plist::Dictionary{{"3:dBIC", 7_i}, {"7:ifw1", 8_i}, {"3:text", "x"}}},
          {"Buffers",
           plist::Dictionary{
               {"13", "controller/long.bin"},
               {"13:0", "controller/ftl.bin"},
               {"10", dataOf("newest")},
               {"10:24", dataOf("a day old")},
               {"221:1", plist::Dictionary{{"Data", dataOf("msp")}, {"Announce", 5_i}}},
               {"221:3", plist::Dictionary{{"File", "controller/ftl.bin"}, {"Announce", 1_i}}},
               {"15", plist::Dictionary{{"Data", dataOf("x")}, {"FailSize", 0xE00002BC_i}}},
               {"17", plist::Dictionary{{"Data", dataOf("x")}, {"FailData", 9_i}}},
               {"22", plist::Dictionary{{"Announce", 4_i}}},
               {"39", plist::Dictionary{{"Data", "text"}, {"FailSize", "5"}}},
               {"40", true},
               {"41", plist::Dictionary{{"Data", dataOf("x")}, {"Announce", 1e300}}},
               {"50", "missing.bin"},
               {"51", "../outside"},
               {"52", "controller"},
               {"53", "loop"},
               {"54", ""},
               {"55", "absolute"}}}});
  plist::Dictionary second = named("Controller");
  second.set("Properties", plist::Dictionary{{"name", "second"}});
  second.set("Driver", plist::Dictionary{{"RefuseOpen", true}});
  plist::Dictionary hidden = named("Hidden", {named("Below")});
  hidden.set("Registered", false);
  hidden.set("Driver",
             plist::Dictionary{{"FailClose", true}, {"RecommendsDeletion", dataOf("abc")}});
  const plist::Dictionary wrong{{"Class", 1_i},       {"Conforms", "Odd"},
                                {"Registered", "no"}, {"Properties", "Odd"},
                                {"Children", "none"}, {"Driver", plist::Array{}}};
  plist::Dictionary bus = named("Bus", {std::move(controller), "no entry", std::move(second)});
  bus.set("Properties", plist::Dictionary{{"depth", 1_i}, {"speed", 4_i}});
  plist::Dictionary root = named("Root", {std::move(bus), std::move(hidden), wrong, named("Last")});
  root.set("Properties", plist::Dictionary{{"depth", 0_i}, {"model", "root"}});
  root.set("Conforms", plist::Array{"Disk"});
  return root;
}

class Registry : public testing::Test, protected support::HostServices {
 protected:
  Registry() {
    folder.write("device/registry.plist", xml(registryFile()));
    folder.write("device/controller/ftl.bin", "statistics");
    folder.write("outside", "outside");
    std::filesystem::create_symlink("loop", folder / "device/loop");
    std::filesystem::create_symlink(folder / "outside", folder / "device/absolute");
    registry.emplace(root, log);
  }

  platform::DriverConnection open(const char* className) {
    const platform::RegistryObject service = registry->DrvGetMatchingService(className);
    const platform::DriverConnection connection = registry->DrvServiceOpen(service, 0).connection;
    registry->release(service);
    return connection;
  }

  std::string nameOf(platform::RegistryObject entry) {
    const auto name = registry->searchProperty(entry, "name", Direction::parents);
    registry->release(entry);
    return plist::description(name);
  }

  // The status, or the bytes that were delivered.
  std::string call(platform::DriverConnection connection, std::uint32_t method,
                   std::vector<std::uint32_t> words, std::size_t capacity) {
    std::vector<std::byte> output(capacity);
    const auto result =
        registry->DrvCallStructMethod(connection, method, std::as_bytes(std::span(words)), output);
    EXPECT_LE(result.outputSize, capacity);
    if (result.status != 0) return "status " + std::to_string(result.status);
    return {reinterpret_cast<const char*>(output.data()), result.outputSize};
  }
  std::string tunnel(platform::DriverConnection connection, std::uint32_t opType,
                     std::uint32_t flags, std::uint32_t argument, std::size_t capacity,
                     std::uint32_t method = 9) {
    return call(connection, method, {opType, flags, argument, 0, 0, 0}, capacity);
  }

  std::optional<DeviceRegistry> registry;
};

TEST_F(Registry, WalksAndMatchesParentsFirst) {
  const struct {
    const char *className, *name;
  } matches[] = {
      {"Controller", "first"}, {"Disk", "first"}, {"Below", "(null)"}, {"Last", "(null)"}};
  for (const auto& [className, name] : matches) {
    const platform::RegistryObject service = registry->DrvGetMatchingService(className);
    EXPECT_NE(service, 0u) << className;
    EXPECT_EQ(nameOf(service), name) << className;
  }
  for (const char* none : {"Root", "Hidden", "Odd", "1", "", "Control"}) {
    EXPECT_EQ(registry->DrvGetMatchingService(none), 0u) << none;
  }

  const platform::RegistryObject iterator = registry->createIterator();
  std::string walk;
  while (const platform::RegistryObject entry = registry->next(iterator)) {
    const char* found = "?";
    for (const char* name : {"Root", "Bus", "Controller", "Namespace", "Hidden", "Below", "Last"}) {
      if (registry->conformsTo(entry, name)) found = name;
    }
    walk += std::string(found) + " ";
    registry->release(entry);
  }
  EXPECT_EQ(walk, "Bus Controller Namespace Controller Hidden Below ? Last ");
  EXPECT_EQ(registry->next(iterator), 0u);
  registry->release(iterator);
  registry.reset();
  EXPECT_TRUE(log.lines().empty());
}

TEST_F(Registry, SearchesUpToTheRootAndThroughOneSubtree) {
  const struct {
    const char *className, *key;
    Direction direction;
    const char* value;
  } rows[] = {{"Namespace", "depth", Direction::parents, "3"},
              {"Namespace", "name", Direction::parents, "first"},
              {"Controller", "depth", Direction::parents, "1"},
              {"Namespace", "model", Direction::parents, "root"},
              {"Namespace", "nowhere", Direction::parents, "(null)"},
              {"Below", "speed", Direction::parents, "(null)"},
              {"Bus", "depth", Direction::children, "1"},
              {"Bus", "name", Direction::children, "first"},
              {"Controller", "depth", Direction::children, "3"},
              {"Namespace", "name", Direction::children, "(null)"},
              {"Controller", "speed", Direction::children, "(null)"},
              {"Last", "model", Direction::children, "(null)"}};
  for (const auto& row : rows) {
    const platform::RegistryObject entry = registry->DrvGetMatchingService(row.className);
    EXPECT_EQ(plist::description(registry->searchProperty(entry, row.key, row.direction)),
              row.value)
        << row.className << " " << row.key;
    registry->release(entry);
  }
}

TEST_F(Registry, TheTunnelAnswersAsTheDictionarySays) {
  const platform::DriverConnection connection = open("Controller");
  const struct {
    std::uint32_t opType, flags, argument;
    std::size_t capacity;
    std::string answer;
  } rows[] = {
      {13, 1, 0, 4, std::string("\x0A\0\0\0", 4)},  // "13:0" goes before "13"
      {13, 0, 0, 10, "statistics"},
      {13, 0, 0, 4, "stat"},
      {13, 0, 0, 99, "statistics"},
      {13, 0, 1, 99, "status 45"},
      {10, 0, 0, 99, "newest"},
      {10, 0, 24, 99, "a day old"},
      {10, 24 << 2, 0, 99, "a day old"},
      {10, 0x400 | 2, 0, 99, "newest"},  // bits 1 and 10 are no part of the argument
      {10, 5 << 2, 24, 99, "a day old"},
      {10, 24 << 2 | 1, 0, 4, std::string("\x09\0\0\0", 4)},
      {221, 1, 1, 4, std::string("\x05\0\0\0", 4)},
      {221, 0, 1, 5, "msp"},
      {221, 1, 3, 4, std::string("\x01\0\0\0", 4)},
      {221, 0, 3, 1, "s"},
      {15, 1, 0, 4, "status 3758097084"},
      {15, 0, 0, 4, "x"},
      {17, 1, 0, 2, std::string("\x01\0", 2)},
      {17, 0, 0, 4, "status 9"},
      {22, 1, 0, 4, std::string("\x04\0\0\0", 4)},
      {22, 0, 0, 4, "status 45"},
      {39, 1, 0, 4, "status 45"},
      {40, 1, 0, 4, "status 45"},
      {41, 1, 0, 4, "\xFF\xFF\xFF\xFF"},
      {99, 1, 0, 4, "status 45"},
  };
  for (const auto& row : rows) {
    for (const std::uint32_t method : {8u, 9u}) {
      EXPECT_EQ(tunnel(connection, row.opType, row.flags, row.argument, row.capacity, method),
                row.answer)
          << row.opType << " " << row.flags << " " << row.argument;
    }
  }
  EXPECT_EQ(tunnel(connection, 13, 0, 0, 10, 7), "status 45");
  EXPECT_EQ(call(connection, 9, {13, 0, 0, 0, 0}, 10), "status 45");
  EXPECT_EQ(registry->DrvServiceClose(connection), 0u);
  EXPECT_EQ(tunnel(connection, 13, 0, 0, 10), "status 1");
  EXPECT_TRUE(log.lines().empty());
}

TEST_F(Registry, ABufferFileThatCantBeReadIsSaidOnce) {
  const platform::DriverConnection connection = open("Controller");
  const struct {
    std::uint32_t opType;
    const char* line;
  } rows[] = {
      {50, "/device/missing.bin: No such file"},      {51, "/device/../outside: not below device/"},
      {52, "/device/controller: not a regular file"}, {53, "/device/loop: too many links"},
      {54, "/device/: not a regular file"},           {55, "/device/absolute: No such file"}};
  for (const auto& [opType, line] : rows) {
    log.clear();
    for (const std::uint32_t flags : {1u, 0u, 1u}) {
      EXPECT_EQ(tunnel(connection, opType, flags, 0, 64), "status 1") << opType;
    }
    EXPECT_EQ(log.count("error: " + folder.path().string() + line), 1) << opType;
    EXPECT_EQ(log.lines().size(), 1u) << opType;
  }
  registry->DrvServiceClose(connection);
}

TEST_F(Registry, DriversOpenCloseAndCountScalars) {
  const platform::DriverConnection first = open("Controller");
  const struct {
    std::uint32_t method;
    std::uint64_t code;
    platform::DriverStatus status;
    std::uint64_t value;
  } rows[] = {{3, 0x64424943, 0, 7},
              {7, 0x69667731, 0, 8},
              {7, 0x64424943, 45, 0},
              {3, 0x74657874, 45, 0},
              {3, 0x164424943, 45, 0}};
  for (const auto& row : rows) {
    std::uint64_t output[2] = {};
    EXPECT_EQ(registry->DrvCallMethod(first, row.method, {&row.code, 1}, output), row.status);
    EXPECT_EQ(output[0], row.value) << row.code;
    EXPECT_EQ(registry->DrvCallMethod(first, row.method, {}, output), 45u);
    EXPECT_EQ(registry->DrvCallMethod(first, row.method, {&row.code, 1}, {}), 45u);
  }
  EXPECT_EQ(call(first, 5, {}, 4), "\x04\x03\x02\x01" + std::string());
  EXPECT_EQ(call(first, 5, {}, 1), "\x04");
  EXPECT_EQ(registry->DrvServiceClose(first), 0u);

  const platform::RegistryObject iterator = registry->createIterator();
  std::string opened;
  while (const platform::RegistryObject entry = registry->next(iterator)) {
    const auto result = registry->DrvServiceOpen(entry, 0);
    EXPECT_EQ(result.status == 0, result.connection != 0);
    registry->release(entry);  // a connection outlives its service's handle
    if (registry->conformsTo(entry, "Hidden")) ADD_FAILURE() << "released";
    opened += result.status == 0 ? call(result.connection, 5, {}, 8) + "," : "-";
    const platform::DriverStatus closed = registry->DrvServiceClose(result.connection);
    if (result.status == 0) opened += std::to_string(closed) + " ";
  }
  registry->release(iterator);
  EXPECT_EQ(opened, "-\x04\x03\x02\x01,0 --abc,1 ---");
  registry.reset();
  EXPECT_TRUE(log.lines().empty());
}

TEST_F(Registry, HandlesOfAnotherKindAreHarmlessAndLostOnesCounted) {
  const platform::RegistryObject service = registry->DrvGetMatchingService("Controller");
  const platform::RegistryObject iterator = registry->createIterator();
  const platform::DriverConnection connection = registry->DrvServiceOpen(service, 0).connection;
  const platform::RegistryObject released = registry->rootEntry();
  registry->release(released);
  registry->release(connection);  // closing is another call
  registry->DrvServiceClose(service);
  for (const std::uint32_t handle : {0u, released, iterator, connection, 0xFFFFFFFFu}) {
    EXPECT_FALSE(registry->conformsTo(handle, "Root"));
    EXPECT_EQ(registry->searchProperty(handle, "model", Direction::parents), std::nullopt);
    EXPECT_NE(registry->DrvServiceOpen(handle, 0).status, 0u);
    EXPECT_TRUE(handle == iterator || registry->next(handle) == 0) << handle;
    EXPECT_EQ(tunnel(handle, 13, 0, 0, 4), handle == connection ? "stat" : "status 1") << handle;
  }
  registry->release(released);
  EXPECT_NE(registry->rootEntry(), released) << "a stale handle never means something else";
  registry.reset();
  EXPECT_EQ(log.lines(), std::vector<std::string>{"error: 4 driver handles were not released"});
}

TEST_F(Registry, WithoutADictionaryThereIsNoRegistry) {
  for (const auto& content : {std::string(), *plist::writeXML(plist::Array{named("Controller")})}) {
    folder.write("device/registry.plist", content);
    if (content.empty()) std::filesystem::remove(folder / "device/registry.plist");
    registry.emplace(root, log);
    EXPECT_EQ(registry->rootEntry(), 0u);
    EXPECT_EQ(registry->createIterator(), 0u);
    EXPECT_EQ(registry->DrvGetMatchingService("Controller"), 0u);
  }
}

}  // namespace
