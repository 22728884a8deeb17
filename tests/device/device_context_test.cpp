// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "device/DeviceContext.h"

#include <vector>

#include <gtest/gtest.h>

#include "support/TestPlatform.h"

namespace morvend {
namespace {

using plist::Value;

// The two functions of the support library, over one stored count.
std::int64_t storedCount = 0;
std::vector<std::string> asked;

std::int64_t readInteger(const char* key, const char* domain, bool* found) {
  asked.push_back(std::string("read ") + key + " " + domain + (found ? " found" : ""));
  return storedCount;
}

void writeValue(const char* key, const Value* value, const char* domain) {
  asked.push_back(std::string("write ") + key + " " + domain);
  storedCount = value->as<plist::Number>()->int64Value();
}

class DeviceContextTest : public ::testing::Test {
 protected:
  support::TestPlatform platform;
  DeviceContext context{platform.platform};
};

TEST_F(DeviceContextTest, ForcesMultiUserModeOnInternalBuildsOnly) {
  const std::string forcing =
      "default: Forcing Multi User Mode behavior due to the presence of /var/db/forceMultiUserMode";
  const struct {
    bool internal, marker;
    std::optional<std::uint32_t> indicator;
    const char* home;
    bool forced;
  } rows[] = {{false, false, 0, "/var/mobile", false}, {false, false, {}, "/var/mobile", false},
              {false, false, 2, "/container", false},  {false, true, 0, "/var/mobile", false},
              {true, true, 0, "/container", true},     {true, false, 0, "/var/mobile", false},
              {true, true, {}, "/container", true}};
  for (const auto& row : rows) {
    support::TestPlatform device;
    device.device.internalBuild = row.internal;
    device.device.multiUser = row.indicator;
    device.device.container = "/container";
    if (row.marker) device.files.contents["/var/db/forceMultiUserMode"] = "";
    DeviceContext probes(device.platform);
    EXPECT_EQ(probes.homeOfCounters(), row.home);
    EXPECT_EQ(device.log.count("Forcing"), 0);
    for (int call = 0; call < 2; ++call) {
      ASSERT_NE(probes.GetHomeDirectoryPath(), nullptr);
      EXPECT_EQ(*probes.GetHomeDirectoryPath(), row.home);
    }
    EXPECT_EQ(device.log.lines(), row.forced ? std::vector{forcing} : std::vector<std::string>{});
  }
}

TEST_F(DeviceContextTest, AsksForTheContainerUntilThereIsOne) {
  platform.device.multiUser = 1;
  // The counters service asks without a word; the probe alone says what is missing.
  EXPECT_EQ(context.homeOfCounters(), std::nullopt);
  EXPECT_TRUE(platform.log.lines().empty());
  EXPECT_EQ(context.GetCountersDatabaseSizeMB(), -1);
  EXPECT_EQ(context.GetHomeDirectoryPath(), nullptr);
  EXPECT_EQ(platform.log.lines(),
            std::vector<std::string>(2, "default: Error getting system group container: 2"));
  platform.device.multiUser = 0;  // asked once in a process
  platform.device.container = "/c";
  EXPECT_EQ(*context.GetHomeDirectoryPath(), "/c");
  EXPECT_EQ(*context.GetHomeDirectoryPath(), "/c");
  EXPECT_EQ(platform.device.containerQueries, 4);
  EXPECT_EQ(context.GetCountersDatabaseSizeMB(), -1) << "of a database that is missing";
}

TEST_F(DeviceContextTest, AsksWhetherTheDeviceIsInternalOnce) {
  EXPECT_FALSE(context.PLIsInternalDevice());
  platform.device.internalBuild = true;
  EXPECT_FALSE(context.PLIsInternalDevice());
  EXPECT_EQ(platform.device.internalBuildQueries, 1);
}

// What is missing is looked for again the next time; what was found is kept.
TEST_F(DeviceContextTest, ReadsAndResetsTheCorruptionCountOnceItCan) {
  storedCount = 4;
  platform.device.libraryLoads = false;
  EXPECT_EQ(context.ReadAndResetDatabaseCorruptionCount(), 0);
  platform.device.libraryLoads = true;
  EXPECT_EQ(context.ReadAndResetDatabaseCorruptionCount(), 0);
  platform.device.symbols = {
      {"QNSPreferencesGetIntegerValue", reinterpret_cast<void*>(readInteger)}};
  EXPECT_EQ(context.ReadAndResetDatabaseCorruptionCount(), 0);
  EXPECT_EQ(storedCount, 4);
  EXPECT_EQ(
      platform.log.lines(),
      (std::vector<std::string>{"error: Failed to dynamically load the FaultwatchSupport framework",
                                "error: Failed to dyanmically link QNSPreferencesGetIntegerValue",
                                "error: Failed to dynamically link QNSPreferencesSetValue",
                                "error: Failed to dynamically link QNSPreferencesSetValue"}));
  platform.device.symbols["QNSPreferencesSetValue"] = reinterpret_cast<void*>(writeValue);
  EXPECT_EQ(context.ReadAndResetDatabaseCorruptionCount(), 4);
  EXPECT_EQ(context.ReadAndResetDatabaseCorruptionCount(), 0);
  EXPECT_EQ(platform.device.loads, 4);
  const std::string place = " DatabaseCorruptionCount com.norba.pellorand";
  EXPECT_EQ(asked, (std::vector{"read" + place, "write" + place, "read" + place, "write" + place}));
}

}  // namespace
}  // namespace morvend
