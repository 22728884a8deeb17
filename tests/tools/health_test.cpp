// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The drives of a made-up machine and the verdict on them, from the kernel's files to the output.
#include <gtest/gtest.h>

#include <nlohmann/json.hpp>
#include <sstream>

#include "host/Host.h"
#include "platform/testing/RecordingLog.h"
#include "support/CommandLine.h"
#include "support/FreshErrors.h"
#include "support/MachineTree.h"
#include "tools/nandinfo/NandinfoCommand.h"

namespace {

using support::put;

class DriveHealth : public testing::Test, protected support::MachineTree {
 protected:
  DriveHealth() { nvme("nvme0", 0); }

  int run(const std::vector<std::string>& arguments) {
    std::vector<const char*> argv = {"nandinfo"};
    for (const auto& argument : arguments) argv.push_back(argument.c_str());
    std::ostringstream outStream, errStream;
    support::freshErrors();
    platform::fakes::RecordingLog log;
    host::Host host(
        {.root = root.path().string(), .machineFiles = folder.path().string(), .log = &log});
    nandinfo::CommandServices services{host.services(), outStream, errStream, terminal};
    services.kept = [&host] { return host.kept(); };
    const int status = nandinfo::runNandinfo(services, static_cast<int>(argv.size()), argv.data());
    out = outStream.str();
    err = errStream.str();
    return status;
  }
  // The verdict after the record of a drive was changed.
  int verdict(auto change, int number = 0) {
    auto changed = record(number);
    change(changed.healthLog);
    write("nvme" + std::to_string(number), changed);
    return run({"health"});
  }
  void byte(std::size_t offset, std::uint64_t value, int status) {
    EXPECT_EQ(verdict([&](auto& page) { put(page, offset, value); }), status)
        << offset << " " << value;
  }

  support::TemporaryFolder root;
  bool terminal = false;
  std::string out, err;
};

// A worn drive that is called good, a good one that is complained of.
TEST_F(DriveHealth, EveryThresholdDecides) {
  EXPECT_EQ(run({"health"}), 3) << "nothing was recorded";
  EXPECT_NE(out.find("\"reasons\": [\"its health log wasn't recorded\"]"), std::string::npos)
      << out;
  const struct {
    std::size_t offset;
    std::uint64_t value;
    int status;
  } rows[] = {{0, 0, 0},    {0, 1, 11},   {0, 2, 10},   {0, 4, 11},  {0, 8, 11},   {0, 16, 10},
              {0, 32, 10},  {0, 64, 0},   {5, 89, 0},   {5, 90, 10}, {5, 99, 10},  {5, 100, 11},
              {5, 255, 11}, {3, 21, 0},   {3, 20, 10},  {3, 11, 10}, {3, 10, 11},  {3, 0, 11},
              {160, 1, 10}, {175, 1, 10}, {196, 1, 10}, {192, 1, 0}, {144, 200, 0}};
  for (const auto& [offset, value, status] : rows) byte(offset, value, status);
  EXPECT_EQ(verdict([](auto& page) { put(page, 3, 0, 2); }), 3) << "it doesn't count its spare";
}

TEST_F(DriveHealth, OnlyWhatGrewSinceItWasAcknowledgedCounts) {
  const auto errors = [this](std::uint64_t count, int number = 0) {
    return verdict([&](auto& page) { put(page, 160, count, 16); }, number);
  };
  EXPECT_EQ(errors(3), 10);
  EXPECT_EQ(run({"health", "--acknowledge"}), 0);
  EXPECT_EQ(errors(3), 0);
  EXPECT_EQ(errors(5), 10);
  EXPECT_NE(out.find("2 errors of the medium more than the 3 that were acknowledged"),
            std::string::npos)
      << out;
  EXPECT_EQ(errors(2), 10) << "the count began anew";
  byte(5, 100, 11);
  EXPECT_EQ(run({"health", "--acknowledge"}), 11) << "wear isn't forgiven";
  nvme("nvme1", 1);
  EXPECT_EQ(errors(3, 1), 11);
  EXPECT_EQ(verdict([](auto&) {}), 10) << "another drive's errors are its own";
  // What can't be kept isn't acknowledged.
  std::filesystem::remove_all(root / "var");
  root.write("var", "in the way");
  EXPECT_EQ(run({"health", "--acknowledge"}), 1);
}

// A verdict that hides a drive that nothing is known of, or a worse one behind it.
TEST_F(DriveHealth, TheWorstDriveDecides) {
  nvme("nvme1", 1);
  EXPECT_EQ(verdict([](auto&) {}), 3) << "the other one isn't known";
  EXPECT_EQ(verdict([](auto& page) { put(page, 5, 95); }), 10);
  EXPECT_EQ(verdict([](auto& page) { put(page, 0, 8); }, 1), 11);
  const auto json = nlohmann::json::parse(out);
  EXPECT_EQ(json["verdict"], "replace");
  EXPECT_EQ(json["drives"][0]["verdict"], "watch");
  EXPECT_EQ(json["drives"][1]["figures"]["criticalWarning"], 8);
  terminal = true;
  EXPECT_EQ(run({"health"}), 11);
  EXPECT_TRUE(
      out.starts_with("The storage: replace\n\nnvme0 (Flash One): watch\n"
                      "  watch: 95 % of the rated endurance is used\n"))
      << out;
}

// The rest of the system meets the drive as it meets any controller.
TEST_F(DriveHealth, TheStorageLibraryDecodesTheDrive) {
  write("nvme0", record(0));
  const struct {
    std::vector<std::string> command;
    const char* out;
  } rows[] = {{{"ftl", "--all"}, "\"hostWrites\": 1000000,"},
              {{"ftl", "--all"}, "\"powerOnHours\": 4321,"},
              {{"ftl"}, "\"TLM_hostWrites\": 1000000,"},
              {{"info"}, "NumLogicalWrites\": 1000000,"},
              {{"health", "servita"}, "MaxPercentageNANDUsed\": 7,"},
              {{"health", "lab"}, "SpareAvailablePercent\": 100,"},
              {{"magazine", "--hours", "24"}, "IsStatMagSupported\": 0"},
              {{"drives"}, "\"dataUnitsWritten\": 8000,"},
              {{"drives"}, "\"capacity\": 1024000000000,"}};
  for (const auto& [command, text] : rows) {
    EXPECT_EQ(run(command), 0) << command[0] << err;
    EXPECT_NE(out.find(text), std::string::npos) << command[0] << text << out;
  }
  EXPECT_EQ(run({"msp"}), 1) << out;
  std::filesystem::remove_all(folder / "run");
  EXPECT_EQ(run({"ftl"}), 1);
  EXPECT_NE(err.find("ZMCStorage answers no command (status 0x2d)"), std::string::npos) << err;
  EXPECT_EQ(run({"drives"}), 0);
  EXPECT_NE(out.find("\"unknown\": \"its health log wasn't recorded\""), std::string::npos);
}

}  // namespace
