// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The NAND log: its text, and when one is written.

#include "NANDInfo/NANDLogWriter.h"

#include <gtest/gtest.h>

#include <limits>
#include <stdexcept>
#include <vector>

#include "NANDInfo/deliver/NANDLog.h"
#include "support/TestPlatform.h"

namespace NANDInfo {
namespace {

using plist::Array, plist::Date, plist::Dictionary, plist::Value;
using Lines = std::vector<std::string>;

constexpr char kDomain[] = "com.norba.pellorand.morvend";
constexpr double kNow = 1795320000.5;  // 2026-11-22 04:00:00
constexpr double kWeek = 604800;

TEST(NANDLog, EveryKindOfValueHasItsEntry) {
  const double infinity = std::numeric_limits<double>::infinity();
  const Dictionary values{{"int", 7},
                          {"text", "7"},
                          {"large", UINT64_MAX},
                          {"negative", INT64_MIN},
                          {"true", true},
                          {"double", 1.25},
                          {"half", 0.125},
                          {"float", 2.5F},
                          {"nan", infinity - infinity},
                          {"inf", infinity},
                          {"array", Array{1, "two", 3.125, Array{}}},
                          {"late", Array{"a", 1}},
                          {"texts", Array{"a"}},
                          {"empty", Array{}},
                          {"date", Date{0}},
                          {"nested", Dictionary{{"k", 1}}},
                          {"", 0}};
  EXPECT_EQ(NANDLogEntries(values),
            "int:7;large:18446744073709551615;negative:-9223372036854775808;true:1;double:1.25;"
            "half:0.12;float:2.50;nan:nan;inf:inf;array:1,two,3.125,(\n);late:a,1;:0");
  EXPECT_EQ(NANDLogEntries({}), "");
}

TEST(NANDLog, DatesAreThoseOfTheZone) {
  const struct {
    double seconds;
    std::int32_t zone;
    const char* text;
  } rows[] = {
      {kNow, 0, "2026-11-22 04:00:00 +0000"},      {kNow, 3600, "2026-11-22 05:00:00 +0100"},
      {kNow, 20700, "2026-11-22 09:45:00 +0545"},  {kNow, -12600, "2026-11-22 00:30:00 -0330"},
      {kNow, -18000, "2026-11-21 23:00:00 -0500"}, {-0.5, 0, "1969-12-31 23:59:59 +0000"}};
  for (const auto& [seconds, zone, text] : rows) EXPECT_EQ(NANDLogDate({seconds}, zone), text);
}

class NANDLogWriterTest : public ::testing::Test {
 protected:
  NANDLogWriterTest() { fakes.clock.secondsSince1970 = kNow; }

  std::optional<Value> lastLogged() { return fakes.preferences.mobile(kDomain, "SSLastLoggedAt"); }

  support::TestPlatform fakes;
  const platform::AllServices& platform = fakes.platform;
};

TEST_F(NANDLogWriterTest, ALogSaysWhereItComesFrom) {
  fakes.device.texts = {
      {"SystemIdentifier", "abc"}, {"HardwareModel", "riscv"}, {"InverseDeviceID", "key"}};
  fakes.device.versionText = "19.1 (19B74)";
  fakes.clock.zone = 7200;
  fakes.kernel.running = {"nandinfo", -5};
  const Dictionary values{{"UserWamp", 1.25}, {"ValidityList[0]", Array{1, 2, 3}}};
  NLW_WriteLog(platform, "165", &values);
  ASSERT_EQ(fakes.submission.logs.size(), 1u);
  const auto& log = fakes.submission.logs[0];
  EXPECT_EQ(log.type + " " + log.name, "165 StorageStatus");
  EXPECT_FALSE(log.options);
  EXPECT_EQ(log.contents,
            "System ID: abc\nHardware Model: riscv\nOS Version: 19.1 (19B74)\n"
            "Date: 2026-11-22 06:00:00 +0200\nIncident ID: incident\nFaultwatch Key: key\n\n"
            "2026-11-22 06:00:00 +0200 nandinfo[-5]: UserWamp:1.25;ValidityList[0]:1,2,3\n");
  EXPECT_EQ(fakes.journal, (Lines{"submit StorageStatus",
                                  std::string("set mobile/") + kDomain +
                                      "/SSLastLoggedAt = 2026-11-22 04:00:00 +0000",
                                  std::string("synchronize ") + kDomain}));
  EXPECT_EQ(lastLogged(), Value(Date{kNow}));
}

TEST_F(NANDLogWriterTest, WithoutAnswersAndEntriesThereIsALogAllTheSame) {
  const Dictionary empty;
  NLW_WriteLog(platform, "1", &empty);
  EXPECT_EQ(fakes.submission.logs.at(0).contents,
            "System ID: (null)\nHardware Model: (null)\nOS Version: \n"
            "Date: 2026-11-22 04:00:00 +0000\nIncident ID: incident\nFaultwatch Key: error\n\n"
            "2026-11-22 04:00:00 +0000 morvend[77]: \n");
}

TEST_F(NANDLogWriterTest, OneLogInSevenDays) {
  const struct {
    Value stored;
    bool written;
  } rows[] = {{Date{kNow - kWeek}, true},      {Date{kNow - kWeek + 0.25}, false},
              {Date{kNow - 6 * 86400}, false}, {Date{kNow + 1e9}, false},
              {Date{kNow - 1e9}, true},        {kNow, true},
              {"2026-11-22T04:00:00Z", true}};
  const Dictionary values;
  for (const auto& [stored, written] : rows) {
    SCOPED_TRACE(description(stored));
    fakes.submission.logs.clear();
    fakes.log.clear();
    fakes.preferences.setMobile(kDomain, "SSLastLoggedAt", stored);
    NLW_WriteLog(platform, "165", nullptr);
    EXPECT_EQ(lastLogged(), stored);
    fakes.log.clear();
    NLW_WriteLog(platform, "165", &values);
    EXPECT_EQ(fakes.submission.logs.size(), written ? 1u : 0u);
    EXPECT_EQ(lastLogged(), written ? Value(Date{kNow}) : stored);
    EXPECT_EQ(fakes.log.lines(),
              written ? Lines()
                      : Lines{"default: NANDLogWriter:Last written at " + description(stored) +
                              " current 2026-11-22 04:00:00 +0000 :skipped"});
  }
}

TEST_F(NANDLogWriterTest, AnExceptionLeavesTheTimeAsItWas) {
  const Dictionary values;
  fakes.submission.beforeLog = [] { throw std::runtime_error("no spool"); };
  NLW_WriteLog(platform, "165", &values);
  EXPECT_EQ(fakes.log.lines(), Lines{"default: An exception occurred: no spool"});
  fakes.submission.beforeLog = [] { throw 5; };
  EXPECT_THROW(NLW_WriteLog(platform, "165", &values), int);
  EXPECT_EQ(lastLogged(), std::nullopt);
}

TEST_F(NANDLogWriterTest, TheCurrentMonthIsThatOfUTC) {
  fakes.clock.zone = 7200;
  fakes.clock.secondsSince1970 = 1798761599;  // 2026-12-31 23:59:59
  EXPECT_EQ(GetCurrentMonthNumber(platform), 12);
  EXPECT_EQ(GetCurrentYear(platform), 2026);
}

}  // namespace
}  // namespace NANDInfo
