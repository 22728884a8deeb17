// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "daemon/ServiceListener.h"

#include <cstdint>
#include <optional>
#include <vector>

#include <gtest/gtest.h>

#include "daemon/Entry.h"
#include "support/TestPlatform.h"

namespace morvend {
namespace {

using plist::Array;
using plist::Data;
using plist::Dictionary;
using plist::Value;
using Lines = std::vector<std::string>;

Dictionary operation(std::int64_t number) { return {{"operation", number}}; }

Dictionary run(std::int64_t day) { return {{"operation", 1}, {"value", day}}; }

Dictionary deliver(Array apps) { return {{"operation", 2}, {"app_data", std::move(apps)}}; }

class ServiceTest : public ::testing::Test {
 protected:
  ServiceTest() {
    platform.counters.today = 20001;
    platform.whitelistScalars({"key"});
    for (const std::int32_t day : {-1, 20000}) platform.history.scalars[{day, "key"}] = 1;
  }

  // One process in service mode that gets these events; its standard and error lines.
  Lines serve(std::vector<std::optional<Dictionary>> events) {
    platform.log.clear();
    platform.journal.clear();
    platform.submission.logs.clear();
    platform.preferences.values.clear();
    for (auto& event : events) platform.service.willDeliver(std::move(event));
    DeviceContext context(platform.platform);
    const char* const arguments[] = {"morvend"};
    RunProcess(platform.platform, context, 1, arguments);
    Lines lines;
    for (const std::string& line : platform.log.lines()) {
      if (support::isAboutStorage(line)) continue;
      if (line.starts_with("default: ") || line.starts_with("error: ")) {
        lines.push_back(line.substr(line.find(' ') + 1));
      }
    }
    lines.erase(lines.begin());
    lines.pop_back();
    return lines;
  }

  int posted() const {
    return static_cast<int>(std::count(platform.journal.begin(), platform.journal.end(),
                                       "post com.norba.pellorand.morvend.logging"));
  }

  support::TestPlatform platform;
};

const std::string kWaiting = "notified of logging status, waiting for activate app info";
const std::string kMovingOn = "never received requested AAI, so moving along without it";
const std::string kUnsolicited = "morvend got (unsolicited -- so ignoring) AAI:\n(\n)";
const std::string kRequested = "morvend got requestedAAI:\n(\n)";
const std::string kSequence = "daily tasks for day 20000";

TEST_F(ServiceTest, ActsOnMessagesAsTheHandshakeSays) {
  const auto wait = operation(0), other = operation(3), delivery = deliver({});
  const struct {
    std::vector<std::optional<Dictionary>> events;
    Lines log;
    int posted;
  } rows[] = {
      {{}, {}, 0},
      {{std::nullopt, std::nullopt}, {}, 0},
      {{wait}, {kWaiting, kMovingOn, kSequence}, 1},
      {{std::nullopt, wait, delivery, delivery},
       {kWaiting, kRequested, kSequence, kUnsolicited},
       1},
      {{wait, wait, run(5), other, delivery}, {kWaiting, kRequested, kSequence}, 1},
      {{delivery, wait}, {kUnsolicited, kWaiting, kMovingOn, kSequence}, 1},
      {{run(20000), wait, delivery}, {kSequence, kUnsolicited}, 0},
      {{other, wait, run(20000), delivery}, {kUnsolicited}, 0},
      // What is missing or of the wrong type is 0.
      {{Dictionary{}, delivery}, {kWaiting, kRequested, kSequence}, 1},
      {{Dictionary{{"operation", "2"}}, delivery}, {kWaiting, kRequested, kSequence}, 1},
      {{Dictionary{{"operation", 1}, {"value", 2.0}}}, {"daily tasks for day 0"}, 0},
      {{Dictionary{{"operation", true}, {"value", 20000}}}, {kSequence}, 0},
      // Only the low 32 bits count.
      {{Dictionary{{"operation", ~std::uint64_t{0} - 0xfffffffe}}}, {"daily tasks for day 0"}, 0},
      {{run(0x7'0000'0000 - 1)}, {"daily tasks for day -1"}, 0},
      {{Dictionary{{"operation", 2}, {"app_data", "text"}}}, {kUnsolicited}, 0},
  };
  for (const auto& row : rows) {
    EXPECT_EQ(serve(row.events), row.log) << &row - rows;
    EXPECT_EQ(posted(), row.posted) << &row - rows;
    // Delivered none is another thing than none delivered.
    const bool delivered = std::count(row.log.begin(), row.log.end(), kRequested) == 1;
    for (const auto& log : platform.submission.logs) {
      const auto contents = platform.parse(log.contents);
      EXPECT_EQ(contents.find("PLActivatedAppInfo") != nullptr, delivered) << &row - rows;
    }
  }
}

TEST_F(ServiceTest, HandsTheDeliveredApplicationsToTheReport) {
  const Dictionary sent{{"bundle_id", "com.b"},
                        {"version", "1.0"},
                        {"orlo_id", std::int64_t{7}},
                        {"arch", std::uint64_t{2}},
                        {"uuid", Data{0, 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 255}}};
  const Dictionary wrong{{"version", 5}, {"uuid", Data{1, 2}}, {"orlo_id", "7"}, {"arch", 9.0}};
  const auto lines = serve({operation(0), deliver({sent, "not a dictionary", wrong, sent})});
  const Dictionary taken{{"bundle", "com.b"},
                         {"version", "1.0"},
                         {"orloID", 7},
                         {"arch", 2},
                         {"uuid", "00010203-0405-0607-0809-0a0b0c0d0eff"}};
  const Dictionary empty{{"bundle", ""}, {"version", ""}, {"orloID", 0}, {"arch", 0}, {"uuid", ""}};
  const Array expected{taken, empty, taken};
  ASSERT_EQ(platform.submission.logs.size(), 1u);
  const auto log = platform.parse(platform.submission.logs[0].contents);
  ASSERT_NE(log.array("PLActivatedAppInfo"), nullptr);
  EXPECT_EQ(*log.array("PLActivatedAppInfo"), expected);
  EXPECT_EQ(lines.at(1), "morvend got requestedAAI:\n" + description(Value(expected)));
}

// The record is written by the gate that a delivery starts, and not by a run for a day.
TEST_F(ServiceTest, WritesTheGateRecordForDeliveriesOnly) {
  constexpr char kRecord[] = "LastCrashLogSerializationDateInDaysSince1970";
  serve({operation(0), deliver({})});
  EXPECT_EQ(platform.preferences.mobile("com.norba.pellorand.morvend", kRecord), Value(20000));
  serve({run(20000)});
  EXPECT_EQ(platform.preferences.mobile("com.norba.pellorand.morvend", kRecord), std::nullopt);
  EXPECT_EQ(platform.submission.logs.size(), 1u);
}

}  // namespace
}  // namespace morvend
