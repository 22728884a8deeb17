// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include <gtest/gtest.h>

#include "host/Host.h"
#include "platform/CountersService.h"
#include "support/TemporaryFolder.h"
#include "support/TestPlatform.h"
#include "tools/demo/Rules.h"
#include "tools/demo/ShowLeft.h"

namespace {

using plist::Dictionary;

TEST(DemoRules, TellsOwnEntriesFromPrefixesAndTheLongestOfThem) {
  support::TestPlatform device;
  const Dictionary entries{{"a.b", Dictionary{{"sig_fig", 1}}}, {"a.b.c.d", Dictionary()}};
  const Dictionary prefixes{{"a.", Dictionary{{"bucket_interval", 10}, {"sig_fig", 2}}},
                            {"a.b.c", Dictionary()}};
  device.setWhitelist(
      {{"Group", Dictionary{{"ScalarKeys", entries}, {"ScalarKeyPrefixes", prefixes}}}});
  morvend::DeviceContext context(device.platform);
  const auto whitelist = report::PLConfig::init(device.platform, context);
  const demo::Rules rules(whitelist.get());
  const struct {
    const char *key, *prefix, *rounding;
  } kRows[] = {
      {"a.b", "own", "1 figure"},
      {"a.b.c.d", "own", "as it is"},
      {"a.b.c.de", "a.b.c", "as it is"},
      {"a.b.c", "a.b.c", "as it is"},
      {"a.bc", "a.", "nearest 10, 2 figures"},
      {"a.", "a.", "nearest 10, 2 figures"},
  };
  for (const auto& [key, prefix, rounding] : kRows) {
    const auto rule = rules.ofScalar(key);
    ASSERT_TRUE(rule) << key;
    EXPECT_EQ(rule->prefix.value_or("own"), prefix) << key;
    EXPECT_EQ(demo::roundingText(*rule->options), rounding) << key;
  }
  EXPECT_FALSE(rules.ofScalar("b"));
  EXPECT_FALSE(rules.ofDistribution("a.b"));
  EXPECT_FALSE(demo::Rules(nullptr).ofScalar("a.b"));
}

TEST(DemoLeft, NamesEachThingThatLeftAndReadsOnOverWhatIsBroken) {
  support::TemporaryFolder root;
  const std::string spool = "var/spool/morvend/";
  root.write(spool + "submitted/StorageStatus.165.20261123T025646Z",
             "OS Version: 17.4\n\n2026-11-23 02:56:46 +0000 morvend[7]: UserWamp:2.33;"
             "com.norba.NANDInfo.NumGCWrites:12;ValidityList[0]:1,2");
  root.write(spool + "submitted/structured-2026-11-22.jsonl",
             "{\"type\": 172, \"data\": {}}\nnonsense\n{\"type\": 172, \"data\": {}}\n");
  root.write(spool + "submitted/log-pellorand.193.20261123T025646Z", "nonsense");
  root.write(spool + "structured/2026-11-23.jsonl", "{\"type\": 176, \"data\": {\"PE\": 1}}\n");
  root.write(spool + "events.jsonl",
             "{\"event\": \"com.norba.a\", \"payload\": {\"b\": 1}}\n"
             "{\"event\": \"com.norba.a\", \"payload\": {\"b\": 1, \"c\": 2}}\n"
             "{\"event\": \"com.norba.massStorage.NANDInfo.SM.Daily.FTLCounters_1\"}\n");
  host::Host host({.root = root.path()});
  for (const char* key : {"com.norba.NANDInfo.BandsPerInternalFlow3", "datausage.wifiInKB.a",
                          "com.norba.tarvenn.numAllInstalledApps", "host.loadavg.1m"}) {
    EXPECT_TRUE(host.counters().set(key, 1, host.services().counters.PLDaysSince1970()));
  }
  demo::Device device(root.path().string());
  const std::string text = demo::showLeft(device, false);
  for (const char* line :
       {"1 entries        key map", "1 entries        nothing: a list as the controller has it",
        "2 records        nothing: raw, type 172", "log-pellorand.193.20261123T025646Z, 8 bytes",
        "Counters that the telemetry set today: 2", "data usage, by what the processes used",
        "storage health, by key map", "magazine whitelist, list of 52",
        "1 records        nothing: raw, type 176", " 2  1 to 2  fixed list of the step",
        "health servita"}) {
    EXPECT_NE(text.find(line), std::string::npos) << line << "\nin\n" << text;
  }
}

}  // namespace
